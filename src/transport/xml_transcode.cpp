#include "transport/xml_transcode.h"

#include <algorithm>

#include <xercesc/util/PlatformUtils.hpp>
#include <xercesc/util/TransService.hpp>

#include "transport/xml_platform.h"

namespace zel {
namespace {

// The library's own names; the local code page plays no part, whatever the process's locale says.
constexpr const char* kUtf8 = "UTF-8";

bool isAscii(std::string_view text)
{
    for (const char c : text) {
        if (static_cast<unsigned char>(c) >= 0x80) {
            return false;
        }
    }
    return true;
}

}  // namespace

XmlText::XmlText(std::string_view utf8)
{
    // XML cannot hold a NUL, and the library's text would silently end at it.
    if (utf8.find('\0') != std::string_view::npos) {
        return;
    }
    if (isAscii(utf8)) {
        text_ = utf8.size() < kInline ? inline_
                                      : static_cast<XMLCh*>(xercesc::XMLPlatformUtils::fgMemoryManager->allocate(
                                            (utf8.size() + 1) * sizeof(XMLCh)));
        std::copy(utf8.begin(), utf8.end(), text_);
        text_[utf8.size()] = 0;
        return;
    }
    try {
        xercesc::TranscodeFromStr transcoded(reinterpret_cast<const XMLByte*>(utf8.data()), utf8.size(), kUtf8,
                                             xercesc::XMLPlatformUtils::fgMemoryManager);
        text_ = transcoded.adopt();
    } catch (...) {
        rethrowIfOutOfMemory();
        text_ = nullptr;
    }
}

XmlText::~XmlText()
{
    if (text_ != nullptr && text_ != inline_) {
        xercesc::XMLPlatformUtils::fgMemoryManager->deallocate(text_);
    }
}

std::string toUtf8(const XMLCh* text)
{
    if (text == nullptr || *text == 0) {
        return {};
    }
    const XMLCh* end = text;
    for (; *end != 0 && *end < 0x80; ++end) {
    }
    if (*end == 0) {
        return std::string(text, end);
    }
    try {
        xercesc::TranscodeToStr transcoded(text, kUtf8, xercesc::XMLPlatformUtils::fgMemoryManager);
        return std::string(reinterpret_cast<const char*>(transcoded.str()), transcoded.length());
    } catch (...) {
        rethrowIfOutOfMemory();
        return {};
    }
}

}  // namespace zel
