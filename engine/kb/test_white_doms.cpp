#include "engine/kb/test_white_doms.h"

TestWhiteDoms::TestWhiteDoms(std::shared_ptr<ap::ReadableFileI> wdb,
                             std::shared_ptr<ap::ReadableFileI> orgs)
    : domains_(std::move(wdb)), orgs_(std::make_shared<ap::SimpleOrgDB>(std::move(orgs))) {}

TestWhiteDoms::TestWhiteDoms(wd::WhiteDomains domains, std::shared_ptr<ap::SimpleOrgDB> orgs)
    : domains_(std::move(domains)), orgs_(std::move(orgs)) {}

ap::WhiteDomainRecord TestWhiteDoms::Lookup(const char* begin, const char* end) {
  const wd::DomainResult found = domains_.Lookup(begin, end);
  ap::WhiteDomainRecord record;
  record.key = found.key;
  record.partial_flag = found.partial_flag;
  record.other_suffix_flag = found.other_suffix_flag;
  return record;
}

bool TestWhiteDoms::find_org(std::uint64_t id, ap::OrgResult& result) {
  if (!orgs_) {
    result.category = ap::kNoOrgCategory;
    return false;
  }
  return orgs_->find_org(id, result);
}

std::shared_ptr<TestWhiteDoms> LoadTestWhiteDoms(ap::FileSystemI& container) {
  auto wdb = container.open(wd::kWhiteDomainsEntry);
  auto orgs = container.open(ap::kOrgsEntry);
  return std::make_shared<TestWhiteDoms>(std::move(wdb), std::move(orgs));
}
