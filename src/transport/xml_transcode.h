#pragma once
// Conversion between the library's byte strings (UTF-8) and the XML library's 16-bit text. Every
// function here needs the XML library started (see xml_platform.h).

#include <cstddef>
#include <string>
#include <string_view>

#include <xercesc/util/XercesDefs.hpp>

namespace zel {

// The XML library's text of one UTF-8 byte string, released when this object goes. Text that is not
// valid UTF-8, or that holds a NUL, gives no result (valid() is false, get() is null); memory running
// out throws std::bad_alloc.
class XmlText {
public:
    explicit XmlText(std::string_view utf8);
    ~XmlText();
    XmlText(const XmlText&) = delete;
    XmlText& operator=(const XmlText&) = delete;

    bool valid() const noexcept { return text_ != nullptr; }
    const XMLCh* get() const noexcept { return text_; }

private:
    // Element and attribute names and most values are short ASCII: they are widened in place,
    // without the transcoding service and without an allocation.
    static constexpr std::size_t kInline = 48;

    XMLCh* text_ = nullptr;
    XMLCh inline_[kInline];
};

// UTF-8 bytes of the XML library's text; null gives the empty string, and so does text that cannot
// be encoded (a lone surrogate, which a parsed document never holds).
std::string toUtf8(const XMLCh* text);

}  // namespace zel
