#include "transport/xml_error_collector.h"

#include "transport/xml_transcode.h"

namespace zel {

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

}  // namespace zel
