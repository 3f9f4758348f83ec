#pragma once
// Reference-counted start and stop of the XML library.
//
// The library's own initialise and terminate calls are not thread-safe, and terminating it while any
// document, parser or transcoded string is alive frees memory under their feet. So every user takes
// a reference: the first reference starts the library, the last one released stops it, and both
// happen under one process-wide mutex. While the library is up a further reference only bumps a
// count.
//
// Starting and stopping the library costs far more than one request, so a session holds one
// XmlPlatformRef for its whole life; the documents and readers that each request and reply make take
// their own references too, which is then cheap and keeps them valid should the session go first.

#include <string>

#include <zelserverapi/IZELServerStatus.h>

namespace zel {

class XmlPlatform {
public:
    XmlPlatform() = delete;

    // Takes one reference, starting the library when it is the first. Returns null, or (with no
    // reference taken) status 393620 carrying the library's message when the library cannot start.
    [[nodiscard]] static IZELServerStatus* acquire();
    // Gives one reference back; the last one stops the library. Without a reference it does nothing.
    static void release() noexcept;

    // Observations for tests and diagnostics.
    static unsigned referenceCount() noexcept;
    // How often this process has started and stopped the library so far.
    static unsigned long startCount() noexcept;
    static unsigned long stopCount() noexcept;
};

// Holds at most one reference to the XML library; releases it when destroyed. Move-only.
class XmlPlatformRef {
public:
    XmlPlatformRef() noexcept = default;
    ~XmlPlatformRef();
    XmlPlatformRef(XmlPlatformRef&& other) noexcept;
    XmlPlatformRef& operator=(XmlPlatformRef&& other) noexcept;
    XmlPlatformRef(const XmlPlatformRef&) = delete;
    XmlPlatformRef& operator=(const XmlPlatformRef&) = delete;

    // Takes a reference unless one is held already. Null on success, else status 393620 as in
    // XmlPlatform::acquire (and nothing is held).
    [[nodiscard]] IZELServerStatus* acquire();
    // Releases the held reference, if any.
    void reset() noexcept;
    bool held() const noexcept { return held_; }

private:
    bool held_ = false;
};

// Call only inside a catch block. Memory running out, in the XML library or in ours, is no fault of
// the document: it leaves as std::bad_alloc, for the guard of the operation to report; any other
// exception returns.
void rethrowIfOutOfMemory();

// Call only inside a catch block; rethrows memory exhaustion as rethrowIfOutOfMemory does. Gives the library's own message (DOM, parse, transcoding, I/O or
// out-of-memory exceptions), the what() of a standard exception, or a fixed text for anything else.
std::string currentXmlExceptionMessage();

}  // namespace zel
