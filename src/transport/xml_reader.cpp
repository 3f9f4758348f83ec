#include "transport/xml_reader.h"

#include <atomic>
#include <cstdint>
#include <limits>
#include <string>

#include <xercesc/dom/DOMDocument.hpp>
#include <xercesc/util/PlatformUtils.hpp>

#include "api/message_numbers.h"
#include "api/status.h"
#include "transport/xml_transcode.h"

namespace zel {

xercesc::InputSource* XmlEntityRefusal::resolveEntity(xercesc::XMLResourceIdentifier* resource)
{
    std::string what = "External entities are not allowed";
    if (resource != nullptr && resource->getSystemId() != nullptr) {
        what += ": " + toUtf8(resource->getSystemId());
    }
    throw XmlEntityRefused(what);
}

void XmlErrorCollector::warning(const xercesc::SAXParseException&) {}

void XmlErrorCollector::error(const xercesc::SAXParseException& exception) { record(exception); }

void XmlErrorCollector::fatalError(const xercesc::SAXParseException& exception) { record(exception); }

void XmlErrorCollector::resetErrors()
{
    failed_ = false;
    message_.clear();
}

void XmlErrorCollector::record(const xercesc::SAXParseException& exception)
{
    if (!failed_) {
        failed_ = true;
        message_ = toUtf8(exception.getMessage());
    }
}

namespace {

constexpr const char* kSystemId = "memory based xml parsing buffer";
constexpr XMLCh kUtf8[] = {'U', 'T', 'F', '-', '8', 0};

bool startsWith(std::string_view text, std::size_t at, std::string_view prefix)
{
    return text.compare(at, prefix.size(), prefix) == 0;
}

// One pass over the markup as the parser will read it (UTF-8, so no byte of a multi-byte character
// is mistaken for markup). Returns why the text is refused, or null. Text the parser would reject
// anyway is let through for it to report: only well-formed documents need counting right.
const char* shapeRefusal(std::string_view text)
{
    std::size_t depth = 0;
    for (std::size_t at = text.find('<'); at != std::string_view::npos; at = text.find('<', at)) {
        std::string_view close = ">";
        if (startsWith(text, at, "<!--")) {
            close = "-->";
        } else if (startsWith(text, at, "<![CDATA[")) {
            close = "]]>";
        } else if (startsWith(text, at, "<?")) {
            close = "?>";
        } else if (startsWith(text, at, "<!")) {
            return "A reply may not hold a document type declaration";
        } else if (startsWith(text, at, "</")) {
            depth -= depth > 0 ? 1 : 0;
        } else {
            // A start tag: every "=" outside a quoted value gives one attribute.
            std::size_t attributes = 0;
            std::size_t end = at + 1;
            for (; end < text.size() && text[end] != '>'; ++end) {
                if (text[end] == '"' || text[end] == '\'') {
                    end = text.find(text[end], end + 1);
                    if (end == std::string_view::npos) {
                        return nullptr;
                    }
                } else if (text[end] == '=' && ++attributes > XmlReader::kMaxAttributes) {
                    return "An element of the reply has too many attributes";
                }
            }
            if (end < text.size() && text[end - 1] != '/' && ++depth > XmlReader::kMaxDepth) {
                return "The reply nests its elements too deep";
            }
            at = end;
            continue;
        }
        at = text.find(close, at + 2);
        if (at == std::string_view::npos) {
            return nullptr;
        }
    }
    return nullptr;
}

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
    if (const char* refusal = shapeRefusal(text)) {
        return makeStatus(msg::kXmlFailure, refusal);
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
        source_->setEncoding(kUtf8);
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
