#include "api/ZELServerString.h"

#include <cstring>
#include <stdexcept>

#include "api/exception_guard.h"

namespace zel {

ZELServerString::ZELServerString(const char* text) : text_(text ? text : "") {}

ZELServerString::ZELServerString(const char* data, unsigned length) { set(data, length); }

ZELServerString& ZELServerString::operator=(const ZELServerString& other)
{
    text_ = other.text_;
    return *this;
}

const char* ZELServerString::assign(const char* text)
{
    return guarded([&] {
        if (text == nullptr) {
            text_.clear();
        } else {
            text_.assign(text);
        }
        return text;
    });
}

bool ZELServerString::equals(const char* text) const
{
    // Compared as length plus bytes, so content with an embedded NUL never equals its prefix.
    return text_ == std::string_view(text ? text : "");
}

void ZELServerString::set(const char* data, unsigned length)
{
    guarded([&] {
        if (data == nullptr) {
            text_.clear();
        } else {
            // std::string copes with `data` pointing into the current content.
            text_.assign(data, length);
        }
    });
}

std::string toStdString(const IZELServerString& text)
{
    const char* bytes = text.data();
    return bytes ? std::string(bytes, text.length()) : std::string();
}

void copyText(std::string_view text, IZELServerString& out)
{
    out.set(text.data(), static_cast<unsigned>(text.size()));
    // A string that could not take the text (memory exhausted inside its own set) must not pass
    // for the whole text: the operation handing it over fails instead.
    if (out.length() != text.size()) {
        throw std::runtime_error("The text could not be handed over.");
    }
}

void handOutText(std::string_view text, IZELServerString& out) noexcept
{
    guarded([&] { copyText(text, out); });
}

}  // namespace zel
