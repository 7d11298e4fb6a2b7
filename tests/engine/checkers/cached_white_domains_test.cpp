#include "engine/checkers/cached_white_domains.h"

#include <gtest/gtest.h>

#include <map>
#include <string>

namespace {

using easy3_impl::CachedWhiteDomains;

// Counts how often each host reaches the white-domain object.
class CountingDomains final : public ap::WhiteDomainI {
 public:
  ap::WhiteDomainRecord Lookup(const char* begin, const char* end) override {
    const std::string host(begin, end);
    ++asked[host];
    ap::WhiteDomainRecord record;
    record.key = host == "paypal.com" ? 101 : 0;
    return record;
  }
  bool find_org(std::uint64_t id, ap::OrgResult& result) override {
    ++orgsAsked;
    result.org_id = static_cast<std::uint32_t>(id);
    result.category = 1;
    return true;
  }
  bool IsCategorised(const char*, const char*, const char*, const char*) override { return false; }
  bool IsShareLink(const char*, const char*, const char*, const char*) override { return false; }

  std::map<std::string, int> asked;
  int orgsAsked = 0;
};

// Remembers the host and path of the last lookup.
class RecordingCategorised final : public ap::CategorizedHostsPathesDB {
 public:
  bool lookup(const std::string& host, const std::string& path, std::uint16_t& category,
              std::uint64_t&, bool&) const override {
    lastHost = host;
    lastPath = path;
    category = 3;
    return host == "phish.example";
  }
  mutable std::string lastHost;
  mutable std::string lastPath;
};

ap::WhiteDomainRecord Ask(CachedWhiteDomains& cache, const std::string& host) {
  return cache.Lookup(host.data(), host.data() + host.size());
}

TEST(CachedWhiteDomains, SameHostTwiceAsksOnce) {
  CountingDomains domains;
  CachedWhiteDomains cache(domains);
  EXPECT_EQ(Ask(cache, "paypal.com").key, 101u);
  EXPECT_EQ(Ask(cache, "paypal.com").key, 101u);
  EXPECT_EQ(domains.asked["paypal.com"], 1);
}

TEST(CachedWhiteDomains, NinthHostEvictsTheLeastRecentlyUsed) {
  CountingDomains domains;
  CachedWhiteDomains cache(domains);
  for (int i = 0; i < 9; ++i) Ask(cache, "h" + std::to_string(i) + ".example");
  Ask(cache, "h0.example");  // evicted by the ninth
  EXPECT_EQ(domains.asked["h0.example"], 2);
  Ask(cache, "h8.example");  // still cached
  EXPECT_EQ(domains.asked["h8.example"], 1);
  // A hit moves the entry to the front: h2 survives the next two new hosts, h3 does not.
  Ask(cache, "h2.example");
  Ask(cache, "n1.example");
  Ask(cache, "n2.example");
  Ask(cache, "h2.example");
  EXPECT_EQ(domains.asked["h2.example"], 1);
  Ask(cache, "h3.example");
  EXPECT_EQ(domains.asked["h3.example"], 2);
}

TEST(CachedWhiteDomains, KeysAreByteExact) {
  CountingDomains domains;
  CachedWhiteDomains cache(domains);
  Ask(cache, "WWW.paypal.com");
  Ask(cache, "www.paypal.com");
  EXPECT_EQ(domains.asked.size(), 2u);
}

TEST(CachedWhiteDomains, OrganisationQueriesAreForwardedUncached) {
  CountingDomains domains;
  CachedWhiteDomains cache(domains);
  ap::OrgResult result;
  EXPECT_TRUE(cache.find_org(101, result));
  EXPECT_TRUE(cache.find_org(101, result));
  EXPECT_EQ(domains.orgsAsked, 2);
  EXPECT_EQ(result.org_id, 101u);
}

TEST(CachedWhiteDomains, CategorisedStripsWwwInAnyCase) {
  CountingDomains domains;
  auto categorised = std::make_shared<RecordingCategorised>();
  CachedWhiteDomains cache(domains, nullptr, categorised);
  const std::string path = "/login";
  for (const std::string host : {"WwW.phish.example", "www.phish.example", "phish.example"}) {
    EXPECT_TRUE(cache.IsCategorised(host.data(), host.data() + host.size(), path.data(),
                                    path.data() + path.size()))
        << host;
    EXPECT_EQ(categorised->lastHost, "phish.example");
    EXPECT_EQ(categorised->lastPath, "/login");
  }
  const std::string other = "www2.phish.example";
  EXPECT_FALSE(cache.IsCategorised(other.data(), other.data() + other.size(), path.data(),
                                   path.data() + path.size()));
  EXPECT_EQ(categorised->lastHost, "www2.phish.example");
  EXPECT_TRUE(domains.asked.empty());  // host questions never touch the white-domain cache
}

TEST(CachedWhiteDomains, WithoutDatabasesEverythingIsFalse) {
  CountingDomains domains;
  CachedWhiteDomains cache(domains);
  const std::string host = "phish.example", path = "/";
  EXPECT_FALSE(cache.IsCategorised(host.data(), host.data() + host.size(), path.data(),
                                   path.data() + path.size()));
  EXPECT_FALSE(cache.IsShareLink(host.data(), host.data() + host.size(), path.data(),
                                 path.data() + path.size()));
}

}  // namespace
