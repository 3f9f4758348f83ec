#pragma once
// XmlErrorCollector: keeps the first error the parser reports. Without an error handler the parser
// stops at a fatal error silently and leaves a partial document behind (an entity bomb cut off at
// the expansion limit still "parses"), so every reply parser installs one of these and treats any
// recorded error as failure. Warnings are ignored.

#include <string>

#include <xercesc/sax/ErrorHandler.hpp>
#include <xercesc/sax/SAXParseException.hpp>

namespace zel {

class XmlErrorCollector : public xercesc::ErrorHandler {
public:
    void warning(const xercesc::SAXParseException& exception) override;
    void error(const xercesc::SAXParseException& exception) override;
    void fatalError(const xercesc::SAXParseException& exception) override;
    void resetErrors() override;

    bool failed() const noexcept { return failed_; }
    // The parser's message of the first error (UTF-8).
    const std::string& firstMessage() const noexcept { return message_; }

private:
    void record(const xercesc::SAXParseException& exception);

    bool failed_ = false;
    std::string message_;
};

}  // namespace zel
