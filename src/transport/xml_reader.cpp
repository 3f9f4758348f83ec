#include "transport/xml_reader.h"

#include <atomic>
#include <cstdint>
#include <limits>

#include <xercesc/dom/DOMDocument.hpp>
#include <xercesc/util/PlatformUtils.hpp>

#include "api/message_numbers.h"
#include "api/status.h"
#include "transport/xml_exception.h"

namespace zel {
namespace {

constexpr const char* kSystemId = "memory based xml parsing buffer";

// Readers that hold the library because they parsed. Unlike a single "this reader started the
// library" flag it cannot be cleared by one reader while another still has a document alive.
std::atomic<unsigned> parsingReaders{0};

}  // namespace

XmlReader::~XmlReader() { releaseAll(); }

bool XmlReader::readerInitialisedLibrary() noexcept { return parsingReaders.load() != 0; }

IZELServerStatus* XmlReader::parse(std::string_view text)
{
    if (busy_) {
        return nullptr;
    }
    busy_ = true;
    if (IZELServerStatus* failure = platform_.acquire()) {
        return failure;
    }
    countedAsReader_ = true;
    ++parsingReaders;
    IZELServerStatus* failure = parseText(text);
    if (failure != nullptr) {
        root_ = nullptr;
        elements_.clear();
    }
    return failure;
}

IZELServerStatus* XmlReader::parseText(std::string_view text)
{
    // The frame that carried the text announced its length in 32 bits; nothing longer is a reply.
    if (text.size() > std::numeric_limits<std::uint32_t>::max()) {
        return makeStatus(msg::kXmlFailure, "The XML text is too long");
    }
    try {
        parser_ =
            std::make_unique<xercesc::XercesDOMParser>(nullptr, xercesc::XMLPlatformUtils::fgMemoryManager, nullptr);
        parser_->setLoadExternalDTD(false);
        parser_->setDisableDefaultEntityResolution(true);
        parser_->setXMLEntityResolver(&refusal_);
        security_.setEntityExpansionLimit(kEntityExpansionLimit);
        parser_->setSecurityManager(&security_);
        parser_->setErrorHandler(&errors_);

        source_ = std::make_unique<xercesc::MemBufInputSource>(
            reinterpret_cast<const XMLByte*>(text.data()), static_cast<std::uint32_t>(text.size()), kSystemId, false);
        parser_->parse(*source_);
    } catch (...) {
        return makeStatus(msg::kXmlFailure, currentXmlExceptionMessage());
    }
    if (errors_.failed()) {
        return makeStatus(msg::kXmlFailure, errors_.firstMessage());
    }
    xercesc::DOMDocument* document = parser_->getDocument();
    root_ = elements_.wrap(document != nullptr ? document->getDocumentElement() : nullptr);
    if (root_ == nullptr) {
        return makeStatus(msg::kXmlFailure, "The XML text holds no document element");
    }
    return nullptr;
}

void XmlReader::releaseAll() noexcept
{
    root_ = nullptr;
    elements_.clear();
    source_.reset();
    parser_.reset();  // the parser owns the document
    if (countedAsReader_) {
        countedAsReader_ = false;
        --parsingReaders;
    }
    platform_.reset();
}

}  // namespace zel
