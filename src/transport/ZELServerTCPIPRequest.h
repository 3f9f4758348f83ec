#pragma once
// The request of the TCP/IP channel: the text that goes on the wire, built as the keyword followed
// by NUL name "=" value for each named value, plus the directive and notification lists the
// result-port exchange reads. Made and destroyed only by the channel.

#include <memory>
#include <string>
#include <string_view>

#include "api/ZELServerStringArray.h"
#include "api/heap.h"
#include "transport/IZELServerRequest.h"
#include "transport/xml_document.h"

namespace zel {

class ZELServerIdentity;

class ZELServerTCPIPRequest final : public IZELServerRequest, public HeapObject {
public:
    // The text starts as `keyword`; when `identity` is given (it is only read here, not kept) the
    // value "identityObject" follows: the identity's document rooted at the keyword, which the
    // identity writes once per keyword (ZELServerIdentity::documentFor) and which is left out when it
    // cannot be written. Then "clientID" = `clientId`, written also when empty. The XML support of
    // the payload operations is made only by the first of them; when it cannot be (the XML library
    // did not start, or memory ran out) they return 393620.
    ZELServerTCPIPRequest(const std::string& keyword, const ZELServerIdentity* identity, const std::string& clientId);
    ~ZELServerTCPIPRequest() override = default;
    ZELServerTCPIPRequest(const ZELServerTCPIPRequest&) = delete;
    ZELServerTCPIPRequest& operator=(const ZELServerTCPIPRequest&) = delete;

    int getText(std::string& out) const override;
    std::string_view textView() const override { return text_; }
    int addValue(const std::string& name, const IZELServerString& value) override;
    int addValue(const std::string& name, const std::string& value) override;
    int addValue(const IZELServerString& name, const IZELServerString& value) override;
    int addBooleanValue(const std::string& name, unsigned flag) override;
    int addValueList(const std::string& name, const IZELServerStringArray& list) override;
    int addValueList(const IZELServerString& name, const IZELServerStringArray& list) override;
    // Root "REP_ADD_SERVICE" (for updates too), one "SERVICE" element with its ten attributes.
    int addServicePayload(const std::string& name, const IZELServerService& service) override;
    int addRepositoryPayload(const std::string& name, const IZELServerString& repositoryName,
                             const IZELServerString& description) override;
    // 0; 393620 without XML support or when the root element cannot be made; the code the object
    // returns when it cannot write itself; the serialiser's message number when writing fails.
    // Nothing is added on failure.
    int addXmlValue(const std::string& name, const XmlWritable& object, const std::string& rootName) override;
    unsigned appendDirectives(const IZELServerStringArray& list) override;
    unsigned getDirectives(IZELServerStringArray& out) const override;
    unsigned appendNotifications(const IZELServerStringArray& list) override;
    unsigned getNotifications(IZELServerStringArray& out) const override;
    // Root named after the keyword, one "USERTOKEN" element.
    int addUserTokenPayload(const std::string& name, const IZELServerUserToken& token) override;
    // Root named after the keyword, one "PATH" element.
    int addPathPayload(const std::string& name, const IZELServerPath& path) override;

private:
    void appendValue(std::string_view name, std::string_view value);
    // The XML support, made on first use; null when it cannot be.
    XmlDocument* xmlSupport();

    std::string text_;
    std::string rootElementName_;
    ZELServerStringArray directiveList_;
    ZELServerStringArray notificationList_;
    std::unique_ptr<XmlDocument> xmlSupport_;
    bool xmlSupportFailed_ = false;
};

}  // namespace zel
