#pragma once
// The library's text value: any bytes, explicit length, compared exactly. The session hands these
// out through createString; inside the library they are also used as plain values.

#include <string>
#include <string_view>

#include <zelserverapi/IZELServerString.h>

#include "api/heap.h"

namespace zel {

class ZELServerString final : public IZELServerString, public HeapObject {
public:
    ZELServerString() = default;
    // A null text reads as the empty text.
    explicit ZELServerString(const char* text);
    ZELServerString(const char* data, unsigned length);
    explicit ZELServerString(std::string text) : text_(std::move(text)) {}
    ZELServerString(const ZELServerString& other) : IZELServerString(), text_(other.text_) {}
    ZELServerString& operator=(const ZELServerString& other);
    ~ZELServerString() override = default;

    // Replaces the content; a null text empties it. Returns the argument.
    const char* assign(const char* text) override;
    const char* data() const override { return text_.c_str(); }
    // Compares with the NUL-terminated text (null reads as empty): same length, same bytes.
    bool equals(const char* text) const override;
    // Copies exactly `length` bytes; null data empties the string whatever the length.
    void set(const char* data, unsigned length) override;
    const char* c_str() const override { return text_.c_str(); }
    unsigned length() const override { return static_cast<unsigned>(text_.size()); }

    const std::string& str() const { return text_; }
    std::string_view view() const { return text_; }

private:
    std::string text_;
};

// The bytes of any implementation of the interface, embedded NULs included.
std::string toStdString(const IZELServerString& text);

// Replaces the content of any implementation of the interface with `text`, embedded NULs included:
// how every text getter and every text out-value of the library hands its text over. Throws when
// `out` did not take the whole text.
void copyText(std::string_view text, IZELServerString& out);

// copyText for a getter slot that hands out a text it holds: whatever fails stays inside the library
// (exception_guard.h), leaving `out` as its own set left it.
void handOutText(std::string_view text, IZELServerString& out) noexcept;

}  // namespace zel
