#pragma once
// Text getters of the repository objects copy a field into the caller's string, embedded NULs
// included.

#include <string>

#include <zelserverapi/IZELServerString.h>

namespace zel {

inline void copyText(const std::string& text, IZELServerString& out)
{
    out.set(text.data(), static_cast<unsigned>(text.size()));
}

}  // namespace zel
