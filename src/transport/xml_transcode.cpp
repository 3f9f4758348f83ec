#include "transport/xml_transcode.h"

#include <xercesc/util/PlatformUtils.hpp>
#include <xercesc/util/TransService.hpp>

namespace zel {
namespace {

// The library's own names; the local code page plays no part, whatever the process's locale says.
constexpr const char* kUtf8 = "UTF-8";

}  // namespace

XmlText::XmlText(std::string_view utf8) noexcept
{
    // XML cannot hold a NUL, and the library's text would silently end at it.
    if (utf8.find('\0') != std::string_view::npos) {
        return;
    }
    try {
        xercesc::TranscodeFromStr transcoded(reinterpret_cast<const XMLByte*>(utf8.data()), utf8.size(), kUtf8,
                                             xercesc::XMLPlatformUtils::fgMemoryManager);
        text_ = transcoded.adopt();
    } catch (...) {
        text_ = nullptr;
    }
}

XmlText::~XmlText()
{
    if (text_ != nullptr) {
        xercesc::XMLPlatformUtils::fgMemoryManager->deallocate(text_);
    }
}

std::string toUtf8(const XMLCh* text)
{
    if (text == nullptr || *text == 0) {
        return {};
    }
    try {
        xercesc::TranscodeToStr transcoded(text, kUtf8, xercesc::XMLPlatformUtils::fgMemoryManager);
        return std::string(reinterpret_cast<const char*>(transcoded.str()), transcoded.length());
    } catch (...) {
        return {};
    }
}

}  // namespace zel
