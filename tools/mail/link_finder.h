// Finds the links a mail reader makes clickable in plain text: "http://" and "https://" links
// (any letter case) and bare "www." hosts, each starting at a word boundary and running to the
// next blank, control character, '<', '>' or '"' (or a no-break or ideographic space), without
// trailing punctuation or closing brackets that the link does not open. A "www." link is given
// as the reader's click would open it, with "http://" in front.
#pragma once

#include <functional>
#include <string>
#include <string_view>

namespace pelmix::mail {

// Calls `onLink` for every link of `text`, in order, duplicates included. `scratch` holds a
// "www." link's prefixed form during the call.
void FindLinks(std::string_view text, const std::function<void(std::string_view)>& onLink,
               std::string& scratch);

}  // namespace pelmix::mail
