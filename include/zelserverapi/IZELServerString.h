#pragma once
// Narrow text that crosses the library boundary: bytes with an explicit length, compared exactly.
// Made by IZELServerSession::createString and destroyed by IZELServerSession::destroyString.

class IZELServerString {
public:
    // Replaces the content with a NUL-terminated text; returns the argument.
    virtual const char* assign(const char* text) = 0;
    // The content, always NUL-terminated (it may also hold NULs of its own, see length()).
    virtual const char* data() const = 0;
    // True when the text has the same length and the same bytes (case-sensitive).
    virtual bool equals(const char* text) const = 0;
    // Replaces the content with exactly `length` bytes; embedded NULs are kept.
    virtual void set(const char* data, unsigned length) = 0;
    // Same as data().
    virtual const char* c_str() const = 0;
    // Number of bytes held.
    virtual unsigned length() const = 0;
    virtual ~IZELServerString() = default;

protected:
    IZELServerString() = default;
    IZELServerString(const IZELServerString&) = default;
    IZELServerString& operator=(const IZELServerString&) = default;
};
