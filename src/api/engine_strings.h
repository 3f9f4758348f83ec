#pragma once
// The host engine's string interfaces. The library implements them (see string_adapters.h) only to
// hand its own text to the message database, whose operations are declared in these terms.

class IZELString {
public:
    // Replaces the content with a NUL-terminated text; returns the argument (adapters may return null).
    virtual const char* assign(const char* text) = 0;
    virtual const char* data() const = 0;
    // Replaces the content with exactly `length` bytes.
    virtual void set(const char* data, unsigned length) = 0;
    // Same as data().
    virtual const char* c_str() const = 0;
    virtual unsigned length() const = 0;
    // In-place re-encodings. Selector 27 is UTF-8 and 0 is the local single-byte code page (Latin-1):
    // encode turns the content (UTF-8) into the selected encoding, decode turns content held in the
    // selected encoding into UTF-8. A conversion that loses characters keeps the lossy text.
    virtual void encodeTo(int selector) = 0;
    virtual void decodeFrom(int selector) = 0;
    virtual void encodeToSecondary(int selector) = 0;
    virtual void decodeFromSecondary(int selector) = 0;
    virtual ~IZELString() = default;

protected:
    IZELString() = default;
    IZELString(const IZELString&) = default;
    IZELString& operator=(const IZELString&) = default;
};

class IZELStringArray {
public:
    virtual const char* element(unsigned index) const = 0;
    // Copies element `index` into `out`; 0 on success, 1 when the index is out of range.
    virtual int getElement(unsigned index, IZELString& out) const = 0;
    virtual unsigned entries() const = 0;
    virtual void append(const char* value) = 0;
    virtual bool isReadOnly() const = 0;
    virtual void append(const IZELString& value) = 0;
    virtual int setElement(unsigned index, const IZELString& value) = 0;
    virtual void insertAt(unsigned index, const char* value) = 0;
    virtual int removeAt(unsigned index) = 0;
    virtual void clear() = 0;
    virtual bool contains(const IZELString& value) const = 0;
    virtual bool contains(const char* value) const = 0;
    virtual int removeAll(const char* value) = 0;
    virtual void sort() = 0;
    virtual ~IZELStringArray() = default;

protected:
    IZELStringArray() = default;
    IZELStringArray(const IZELStringArray&) = default;
    IZELStringArray& operator=(const IZELStringArray&) = default;
};
