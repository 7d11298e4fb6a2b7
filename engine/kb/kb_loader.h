// Fills the loaded knowledge from the knowledge-base file: the container is opened over the
// file and every knowledge base is read with its own reader, in a fixed order. The first
// fault ends the load; nothing is caught here.
#pragma once

#include <memory>

#include "engine/common/file_interfaces.h"
#include "engine/kb/web_checker_v3_data.h"

namespace loaders_misc {

inline constexpr char kWebFlowEntry[] = "web.flow";
inline constexpr char kMailFlowEntry[] = "mail.flow";

// Order: white domains and organisations ("wdb", "orgs"), lexemes ("lexdb.txt"), the web and
// mail decision objects ("web.flow", "mail.flow"), share links ("share_links.txt"),
// categorised hosts ("sb.db", may be absent), and last the configuration ("v3.cfg").
void load(WebCheckerV3Data& knowledge, std::shared_ptr<ap::FileIO> file);

}  // namespace loaders_misc
