// pelmix dump url: what the page analysis reads from URLs: the host it looks up (ASCII
// form), the rest, the link class, the address tests and the registrable domain.
#include <iostream>

#include "engine/features/url_splitter.h"
#include "tools/pelmix/command.h"
#include "tools/pelmix/json_lines.h"

namespace pelmix::cli {
namespace {

int RunDumpUrl(const std::vector<std::string>& args, const GlobalOptions&) {
  std::string page;
  std::vector<std::string> urls;
  for (std::size_t i = 0; i < args.size(); ++i) {
    if (args[i] == "--page") {
      if (i + 1 >= args.size()) return UsageError("dump url: --page needs a URL");
      page = args[++i];
    } else {
      urls.push_back(args[i]);
    }
  }
  if (urls.empty()) return UsageError("dump url needs at least one URL");
  html_features::UrlParts pageParts;
  std::string pageDomain;
  if (!page.empty()) {
    html_features::SplitUrl(page, pageParts);
    if (pageParts.hasHost)
      pageDomain = std::string(html_features::RegistrableDomain(pageParts.host));
  }
  for (const std::string& url : urls) {
    html_features::UrlParts parts;
    html_features::SplitUrl(url, parts);
    JsonLine line;
    line.Bytes("url", url);
    if (parts.hasHost) {
      line.Bytes("host", parts.host);
      line.Bytes("path", parts.path);
    } else {
      line.Raw("host", "null");
      line.Raw("path", "null");
    }
    line.Int("class", static_cast<int>(parts.linkClass));
    line.Bool("ip", parts.hasHost && html_features::IsDottedIPv4(parts.host));
    line.Bool("special_ip", parts.hasHost && html_features::IsSpecialAddress(parts.host));
    if (parts.hasHost) {
      line.Bytes("registrable", html_features::RegistrableDomain(parts.host));
    } else {
      line.Raw("registrable", "null");
    }
    if (!page.empty()) {
      // A relative reference is the page's own site; a host is when its registrable domain
      // is the page's (the organisations of a knowledge base are not consulted here).
      const bool own =
          parts.relative || (parts.hasHost && pageParts.hasHost &&
                             html_features::RegistrableDomain(parts.host) == pageDomain);
      line.Bool("own_site", own);
    }
    line.Write(std::cout);
  }
  return kExitOk;
}

}  // namespace

PELMIX_COMMAND({"dump url", "[--page URL] URL...",
                "print how the page analysis splits each URL (host, path, class, addresses, "
                "registrable domain), as JSON Lines",
                RunDumpUrl})

}  // namespace pelmix::cli
