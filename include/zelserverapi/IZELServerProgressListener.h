#pragma once
// Follows one file transfer. The library calls, in this order: totalSize once, start once, position
// before each chunk (bytes moved so far), and finish after the last byte. The listener is owned by
// the caller and must outlive the call that was given it.

class IZELServerProgressListener {
public:
    virtual void totalSize(unsigned bytes) = 0;
    virtual void start() = 0;
    virtual void position(unsigned bytesSoFar) = 0;
    virtual void finish() = 0;
    virtual ~IZELServerProgressListener() = default;

protected:
    IZELServerProgressListener() = default;
    IZELServerProgressListener(const IZELServerProgressListener&) = default;
    IZELServerProgressListener& operator=(const IZELServerProgressListener&) = default;
};
