#pragma once
// The library's text presented to the host engine's string interfaces, which are the parameter
// types of the message database. Two adapters only borrow (and never write through what they
// borrow); the third owns a writable copy.

#include <string>

#include <zelserverapi/IZELServerString.h>
#include <zelserverapi/IZELServerStringArray.h>

#include "api/engine_strings.h"
#include "api/heap.h"

namespace zel {

// Read-only view of a library string. Every write is refused silently: assign returns null and
// does nothing, set and the re-encodings do nothing. With nothing borrowed, data is null and the
// length 0. The borrowed string must outlive the wrapper.
class ZELROStringWrapper final : public IZELString, public HeapObject {
public:
    explicit ZELROStringWrapper(const IZELServerString* target = nullptr) : target_(target) {}
    ZELROStringWrapper(const ZELROStringWrapper&) = default;
    ZELROStringWrapper& operator=(const ZELROStringWrapper&) = default;
    ~ZELROStringWrapper() override = default;

    const char* assign(const char*) override { return nullptr; }
    const char* data() const override { return target_ ? target_->data() : nullptr; }
    void set(const char*, unsigned) override {}
    const char* c_str() const override { return data(); }
    unsigned length() const override { return target_ ? target_->length() : 0; }
    void encodeTo(int) override {}
    void decodeFrom(int) override {}
    void encodeToSecondary(int) override {}
    void decodeFromSecondary(int) override {}

    // Borrows what the other wrapper borrows (possibly nothing).
    void rebind(const ZELROStringWrapper& other) { target_ = other.target_; }

private:
    const IZELServerString* target_;
};

// Read-only view of a library string list. Reads and searches go to the borrowed list; every
// modifier does nothing and, where it returns a value, returns 0. isReadOnly is always true.
// With nothing borrowed the list reads as empty. The borrowed list must outlive the wrapper.
class ZELROStringArrayWrapper final : public IZELStringArray, public HeapObject {
public:
    explicit ZELROStringArrayWrapper(const IZELServerStringArray* target = nullptr) : target_(target) {}
    ZELROStringArrayWrapper(const ZELROStringArrayWrapper&) = default;
    ZELROStringArrayWrapper& operator=(const ZELROStringArrayWrapper&) = default;
    ~ZELROStringArrayWrapper() override = default;

    // "" when nothing is borrowed or the index is out of range.
    const char* element(unsigned index) const override;
    // 1 when nothing is borrowed or the index is out of range (`out` untouched); otherwise 0 after
    // handing the element's bytes to out.set.
    int getElement(unsigned index, IZELString& out) const override;
    unsigned entries() const override { return target_ ? target_->entries() : 0; }
    void append(const char*) override {}
    bool isReadOnly() const override { return true; }
    void append(const IZELString&) override {}
    int setElement(unsigned, const IZELString&) override { return 0; }
    void insertAt(unsigned, const char*) override {}
    int removeAt(unsigned) override { return 0; }
    void clear() override {}
    bool contains(const IZELString& value) const override;
    bool contains(const char* value) const override;
    int removeAll(const char*) override { return 0; }
    void sort() override {}

private:
    const IZELServerStringArray* target_;
};

// Writable engine string that owns its bytes.
//
// Re-encoding selectors: 27 is UTF-8 and 0 is Latin-1; any other selector leaves the content alone.
// encodeTo takes UTF-8 content into the selected encoding, decodeFrom takes content held in the
// selected encoding back to UTF-8; with selector 27 both leave the bytes as they are (invalid
// sequences are not repaired). UTF-8 to Latin-1 is lossy: each character above U+00FF and each
// malformed byte becomes '?', and that lossy text is kept rather than the conversion refused,
// because the message database only displays it. The secondary entries run the same conversions
// as their primary counterparts; the engine merely reaches them through other slots.
class ZELObsoleteStringImp final : public IZELString, public HeapObject {
public:
    ZELObsoleteStringImp() = default;
    explicit ZELObsoleteStringImp(std::string text) : text_(std::move(text)) {}
    ZELObsoleteStringImp(const ZELObsoleteStringImp& other) : IZELString(), text_(other.text_) {}
    ZELObsoleteStringImp& operator=(const ZELObsoleteStringImp& other);
    ~ZELObsoleteStringImp() override = default;

    // A null text empties the content; returns the argument.
    const char* assign(const char* text) override;
    const char* data() const override { return text_.c_str(); }
    // Null data empties the content whatever the length.
    void set(const char* data, unsigned length) override;
    const char* c_str() const override { return text_.c_str(); }
    unsigned length() const override { return static_cast<unsigned>(text_.size()); }
    void encodeTo(int selector) override;
    void decodeFrom(int selector) override;
    void encodeToSecondary(int selector) override { encodeTo(selector); }
    void decodeFromSecondary(int selector) override { decodeFrom(selector); }

    const std::string& str() const { return text_; }

    static constexpr int kUtf8Selector = 27;
    static constexpr int kLatin1Selector = 0;

private:
    std::string text_;
};

}  // namespace zel
