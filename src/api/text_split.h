#pragma once
// The one-shot splitter: cuts a text at a set of delimiter characters, the last part taking the
// rest verbatim. The transport cuts every reply into its status word and body with it.

#include <cstddef>
#include <string>
#include <string_view>
#include <vector>

namespace zel {

// Appends the parts of `text` to `out` and returns how many it appended. Repeatedly: skip the
// characters of `delimiters` (any of them; NUL may be one), then take the run up to the next
// delimiter character as a part; an empty run (the end of the text) stops without a part. The part
// that reaches `maxParts` is instead the whole rest of the text from the end of the previous part
// (the start of the text for the first) plus delimiters.size() bytes, verbatim, and ends the split.
// `maxParts` 0 means no limit.
//
// The transport splits a reply at NUL into at most 2 parts, so "\0\0SUCCESS\0a\0b" gives "SUCCESS"
// and "a\0b", while "SUCCESS\0" and "SUCCESS" give only the status word.
std::size_t splitOnce(std::string_view text, std::string_view delimiters, std::size_t maxParts,
                      std::vector<std::string>& out);

}  // namespace zel
