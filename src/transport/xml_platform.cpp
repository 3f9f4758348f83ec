#include "transport/xml_platform.h"

#include <exception>
#include <mutex>
#include <new>
#include <string>
#include <utility>

#include <xercesc/dom/DOMException.hpp>
#include <xercesc/dom/DOMLSException.hpp>
#include <xercesc/sax/SAXException.hpp>
#include <xercesc/util/OutOfMemoryException.hpp>
#include <xercesc/util/PlatformUtils.hpp>
#include <xercesc/util/XMLException.hpp>

#include "api/message_numbers.h"
#include "api/status.h"
#include "transport/xml_transcode.h"

namespace zel {

namespace {

struct PlatformState {
    std::mutex mutex;
    unsigned references = 0;
    unsigned long starts = 0;
    unsigned long stops = 0;
};

// Never destroyed: a reference released from another static object's destructor at process exit
// must still find the mutex.
PlatformState& state()
{
    static PlatformState* const instance = new PlatformState;
    return *instance;
}

// The library failed to start, so its transcoding service may not exist: keep the ASCII part of the
// message and mark everything else.
std::string plainText(const XMLCh* text)
{
    std::string result;
    for (; text != nullptr && *text != 0; ++text) {
        result += *text < 0x80 ? static_cast<char>(*text) : '?';
    }
    return result;
}

}  // namespace

IZELServerStatus* XmlPlatform::acquire()
{
    PlatformState& s = state();
    std::lock_guard<std::mutex> lock(s.mutex);
    if (s.references == 0) {
        try {
            xercesc::XMLPlatformUtils::Initialize();
        } catch (const xercesc::XMLException& e) {
            return makeStatus(msg::kXmlFailure, plainText(e.getMessage()));
        } catch (...) {
            return makeStatus(msg::kXmlFailure, "The XML library could not be initialised");
        }
        ++s.starts;
    }
    ++s.references;
    return nullptr;
}

void XmlPlatform::release() noexcept
{
    PlatformState& s = state();
    std::lock_guard<std::mutex> lock(s.mutex);
    if (s.references == 0) {
        return;
    }
    if (--s.references == 0) {
        xercesc::XMLPlatformUtils::Terminate();
        ++s.stops;
    }
}

unsigned XmlPlatform::referenceCount() noexcept
{
    PlatformState& s = state();
    std::lock_guard<std::mutex> lock(s.mutex);
    return s.references;
}

unsigned long XmlPlatform::startCount() noexcept
{
    PlatformState& s = state();
    std::lock_guard<std::mutex> lock(s.mutex);
    return s.starts;
}

unsigned long XmlPlatform::stopCount() noexcept
{
    PlatformState& s = state();
    std::lock_guard<std::mutex> lock(s.mutex);
    return s.stops;
}

XmlPlatformRef::~XmlPlatformRef() { reset(); }

XmlPlatformRef::XmlPlatformRef(XmlPlatformRef&& other) noexcept : held_(std::exchange(other.held_, false)) {}

XmlPlatformRef& XmlPlatformRef::operator=(XmlPlatformRef&& other) noexcept
{
    if (this != &other) {
        reset();
        held_ = std::exchange(other.held_, false);
    }
    return *this;
}

IZELServerStatus* XmlPlatformRef::acquire()
{
    if (held_) {
        return nullptr;
    }
    IZELServerStatus* failure = XmlPlatform::acquire();
    held_ = failure == nullptr;
    return failure;
}

void XmlPlatformRef::reset() noexcept
{
    if (std::exchange(held_, false)) {
        XmlPlatform::release();
    }
}

void rethrowIfOutOfMemory()
{
    try {
        throw;
    } catch (const xercesc::OutOfMemoryException&) {
        throw std::bad_alloc();
    } catch (const std::bad_alloc&) {
        throw;
    } catch (...) {
    }
}

std::string currentXmlExceptionMessage()
{
    rethrowIfOutOfMemory();
    try {
        throw;
    } catch (const xercesc::XMLException& e) {
        return toUtf8(e.getMessage());
    } catch (const xercesc::DOMException& e) {  // DOMLSException too
        return toUtf8(e.getMessage());
    } catch (const xercesc::SAXException& e) {
        return toUtf8(e.getMessage());
    } catch (const std::exception& e) {
        return e.what();
    } catch (...) {
        return "Unknown XML library failure";
    }
}

}  // namespace zel
