// Fills the loaded knowledge from the knowledge-base file: the container is opened over the
// file and every knowledge base is read with its own reader, in a fixed order. The first
// fault ends the load; nothing is caught here.
#pragma once

#include <cstddef>
#include <memory>

#include "engine/common/file_interfaces.h"
#include "engine/kb/web_checker_v3_data.h"

namespace loaders_misc {

inline constexpr char kWebFlowEntry[] = "web.flow";
inline constexpr char kMailFlowEntry[] = "mail.flow";

// The vectors the checkers hand the decision models: a web page's features, and a mail's
// page features followed by its 81 link features. A model reading past them is refused.
inline constexpr std::size_t kWebVectorSize = 214;
inline constexpr std::size_t kMailVectorSize = 260;

// Order: white domains and organisations ("wdb", "orgs"), lexemes ("lexdb.txt"), the web and
// mail decision objects ("web.flow", "mail.flow"), share links ("share_links.txt"),
// categorised hosts ("sb.db", may be absent), and last the configuration ("v3.cfg").
void load(WebCheckerV3Data& knowledge, std::shared_ptr<ap::FileIO> file);

}  // namespace loaders_misc
