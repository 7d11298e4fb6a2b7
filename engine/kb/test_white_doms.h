// The engine's white-domain object: the white-domain set ("wdb") answers for hosts, the
// organisations database ("orgs") for organisations. The host-and-path questions belong to
// the checkers' white-domain cache, which has the databases for them; this object answers
// them with false.
#pragma once

#include <memory>

#include "engine/common/file_interfaces.h"
#include "engine/kb/org_db.h"
#include "engine/kb/white_domain_i.h"
#include "engine/kb/white_domains.h"

class TestWhiteDoms final : public ap::WhiteDomainI {
 public:
  // Reads both entries: "wdb" first (a null one raises std::runtime_error "null pointer to
  // readable in WhiteDomains"), then "orgs" (a null one raises ap::Error "Failed to load
  // orgs db - null file").
  TestWhiteDoms(std::shared_ptr<ap::ReadableFileI> wdb, std::shared_ptr<ap::ReadableFileI> orgs);
  TestWhiteDoms(wd::WhiteDomains domains, std::shared_ptr<ap::SimpleOrgDB> orgs);

  ap::WhiteDomainRecord Lookup(const char* begin, const char* end) override;
  bool find_org(std::uint64_t id, ap::OrgResult& result) override;
  bool IsCategorised(const char*, const char*, const char*, const char*) override { return false; }
  bool IsShareLink(const char*, const char*, const char*, const char*) override { return false; }

  const wd::WhiteDomains& domains() const { return domains_; }

 private:
  wd::WhiteDomains domains_;
  std::shared_ptr<ap::SimpleOrgDB> orgs_;
};

// Opens "wdb" and "orgs" in `container` and builds the white-domain object from them.
std::shared_ptr<TestWhiteDoms> LoadTestWhiteDoms(ap::FileSystemI& container);
