#pragma once
// The outcome of a failed operation. Every operation that can fail returns an owned status pointer:
// null means success; otherwise the caller destroys it through IZELServerSession::destroyStatus.

class IZELServerStatus {
public:
    // The message text from the library's message catalogue, with the call's parameters filled in.
    // When the catalogue cannot be read the text is "Could not load resource: " and the number.
    virtual const char* getMessage() const = 0;
    // The catalogue number, for example 393619.
    virtual unsigned getMessageNumber() const = 0;
    // A secondary code given by the operation that failed; 0 unless it documents one.
    virtual unsigned getCode() const = 0;
    virtual ~IZELServerStatus() = default;

protected:
    IZELServerStatus() = default;
    IZELServerStatus(const IZELServerStatus&) = default;
    IZELServerStatus& operator=(const IZELServerStatus&) = default;
};
