#pragma once
// The host engine's log object, as far as this library uses it: DllSetMemoryErrorHandler stores a
// caller-owned sink, and the library's out-of-memory routine writes one message through slot 3.

class IZELLogSink {
public:
    virtual void setSeverityThreshold(int severity) = 0;
    virtual int getSeverityThreshold() const = 0;
    virtual void flush() = 0;
    // Writes one message. The library reports exhausted memory with severity 3.
    virtual void logMessageString(const char* message, int severity) = 0;
    virtual ~IZELLogSink() = default;

protected:
    IZELLogSink() = default;
    IZELLogSink(const IZELLogSink&) = default;
    IZELLogSink& operator=(const IZELLogSink&) = default;
};
