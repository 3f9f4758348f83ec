#include "api/text_split.h"

#include <algorithm>

namespace zel {

std::size_t splitOnce(std::string_view text, std::string_view delimiters, std::size_t maxParts,
                      std::vector<std::string>& out)
{
    std::size_t added = 0;
    std::size_t previousEnd = 0;
    while (true) {
        const std::size_t start = std::min(text.find_first_not_of(delimiters, previousEnd), text.size());
        const std::size_t end = std::min(text.find_first_of(delimiters, start), text.size());
        if (start == end) {
            return added;
        }
        ++added;
        if (added == maxParts) {
            // Verbatim from one delimiter-set length past the previous part: a body may itself hold
            // NULs, and a body that starts with one keeps it.
            out.emplace_back(text.substr(std::min(previousEnd + delimiters.size(), text.size())));
            return added;
        }
        out.emplace_back(text.substr(start, end - start));
        previousEnd = end;
    }
}

}  // namespace zel
