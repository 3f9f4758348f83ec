#include "transport/ZELServerTCPIPRequest.h"

#include <utility>
#include <vector>

#include <zelserverapi/IZELServerPath.h>
#include <zelserverapi/IZELServerService.h>
#include <zelserverapi/IZELServerUserToken.h>

#include "api/ZELServerString.h"
#include "api/conversions.h"
#include "api/message_numbers.h"
#include "api/text_encoding.h"
#include "security/ZELServerIdentity.h"
#include "transport/payload_fields.h"
#include "transport/xml_document.h"

namespace zel {
namespace {

constexpr unsigned kCustomFormatType = 2;
constexpr unsigned kCustomTransformerType = 3;
constexpr unsigned kTemplateType = 4;

// Values a caller hands in may be in the local single-byte encoding; the document is UTF-8, so such
// text is converted the way the channel converts a request text that is not UTF-8.
bool setCallerText(XmlElement& element, std::string_view name, const std::string& value)
{
    return isValidUtf8(value) ? element.setAttribute(name, value) : element.setAttributeLocal(name, value);
}

using Attributes = std::vector<std::pair<const char*, std::string>>;

// One element below the document's root with its attributes. They are set in the order given, but
// the serialiser writes an element's attributes sorted by name whatever that order; the server reads
// them by name.
class ElementXml final : public XmlWritable {
public:
    ElementXml(const char* tag, Attributes attributes) : tag_(tag), attributes_(std::move(attributes)) {}

    unsigned writeXml(XmlDocument& document) const override
    {
        XmlElement* root = document.documentElement();
        XmlElement* element = document.createElement(tag_);
        if (root == nullptr || element == nullptr || !root->appendChild(element)) {
            return msg::kXmlFailure;
        }
        for (const auto& [name, value] : attributes_) {
            if (!setCallerText(*element, name, value)) {
                return msg::kXmlFailure;
            }
        }
        return 0;
    }

private:
    const char* tag_;
    Attributes attributes_;
};

template <class Object>
std::string textOf(const Object& object, void (Object::*getter)(IZELServerString&) const)
{
    ZELServerString text;
    (object.*getter)(text);
    return text.str();
}

std::string flagText(unsigned flag) { return booleanText(flag != 0); }

// Appends every entry of `from` to `to` and returns how many. The count is taken first, so a
// list appended to itself is doubled once instead of growing for ever.
unsigned appendEntries(const IZELServerStringArray& from, ZELServerStringArray& to)
{
    const unsigned count = from.entries();
    ZELServerString entry;
    for (unsigned i = 0; i < count; ++i) {
        from.getElement(i, entry);
        to.append(entry);
    }
    return count;
}

unsigned copyEntries(const ZELServerStringArray& from, IZELServerStringArray& to)
{
    for (const std::string& entry : from.items()) {
        to.append(ZELServerString(entry));
    }
    return from.entries();
}

// Releases the request's current document however the payload operation ends.
class DocumentScope {
public:
    explicit DocumentScope(XmlDocument& document) : document_(document) {}
    ~DocumentScope() { document_.releaseDocument(); }
    DocumentScope(const DocumentScope&) = delete;
    DocumentScope& operator=(const DocumentScope&) = delete;

private:
    XmlDocument& document_;
};

}  // namespace

ZELServerTCPIPRequest::ZELServerTCPIPRequest(const std::string& keyword, const ZELServerIdentity* identity,
                                             const std::string& clientId)
    : text_(keyword), rootElementName_(keyword)
{
    // A request goes out without the identity rather than not at all; the server then answers for
    // an anonymous caller.
    if (const std::string* document = identity != nullptr ? identity->documentFor(keyword) : nullptr) {
        appendValue("identityObject", *document);
    }
    appendValue("clientID", clientId);
}

XmlDocument* ZELServerTCPIPRequest::xmlSupport()
{
    if (xmlSupport_ == nullptr && !xmlSupportFailed_) {
        xmlSupport_.reset(new XmlDocument());
        IZELServerStatus* failure = xmlSupport_ != nullptr ? xmlSupport_->startXml() : nullptr;
        if (xmlSupport_ == nullptr || failure != nullptr) {
            delete failure;
            xmlSupport_.reset();
            xmlSupportFailed_ = true;
        }
    }
    return xmlSupport_.get();
}

void ZELServerTCPIPRequest::appendValue(std::string_view name, std::string_view value)
{
    text_ += '\0';
    text_ += name;
    text_ += '=';
    text_ += value;
}

int ZELServerTCPIPRequest::getText(std::string& out) const
{
    out = text_;
    return 0;
}

int ZELServerTCPIPRequest::addValue(const std::string& name, const IZELServerString& value)
{
    appendValue(name, toStdString(value));
    return 0;
}

int ZELServerTCPIPRequest::addValue(const std::string& name, const std::string& value)
{
    appendValue(name, value);
    return 0;
}

int ZELServerTCPIPRequest::addValue(const IZELServerString& name, const IZELServerString& value)
{
    appendValue(toStdString(name), toStdString(value));
    return 0;
}

int ZELServerTCPIPRequest::addBooleanValue(const std::string& name, unsigned flag)
{
    appendValue(name, flag == 1 ? "true" : "false");
    return 0;
}

int ZELServerTCPIPRequest::addValueList(const std::string& name, const IZELServerStringArray& list)
{
    return addValueList(ZELServerString(name), list);
}

int ZELServerTCPIPRequest::addValueList(const IZELServerString& /*name*/, const IZELServerStringArray& list)
{
    // The list's own name never reaches the wire: the server knows directives by their pair names.
    const unsigned count = list.entries();
    ZELServerString pairName;
    ZELServerString pairValue;
    for (unsigned i = 1; i < count; i += 2) {
        list.getElement(i - 1, pairName);
        list.getElement(i, pairValue);
        addValue(pairName, pairValue);
    }
    return 0;
}

int ZELServerTCPIPRequest::addServicePayload(const std::string& name, const IZELServerService& service)
{
    const auto* fields = dynamic_cast<const ServicePayloadFields*>(&service);
    const ElementXml element(
        "SERVICE",
        {
            {"service_id", fields != nullptr ? fields->serviceId() : std::string("-1")},
            {"name", textOf(service, &IZELServerService::getName)},
            {"display_name", textOf(service, &IZELServerService::getDisplayName)},
            {"description", textOf(service, &IZELServerService::getDescription)},
            {"url_pattern", textOf(service, &IZELServerService::getUrlPattern)},
            {"is_enabled", flagText(service.isEnabled())},
            {"is_workspace_reg_allowed", flagText(service.isWorkspaceRegistrationAllowed())},
            {"is_customformat_reg_allowed", flagText(service.isRegistrationAllowed(kCustomFormatType))},
            {"is_customtransform_reg_allowed", flagText(service.isRegistrationAllowed(kCustomTransformerType))},
            {"is_template_reg_allowed", flagText(service.isRegistrationAllowed(kTemplateType))},
        });
    // The server looks only at the "SERVICE" element; the root keeps the add command's name even
    // when the service is sent for an update.
    return addXmlValue(name, element, "REP_ADD_SERVICE");
}

int ZELServerTCPIPRequest::addRepositoryPayload(const std::string& name, const IZELServerString& repositoryName,
                                                const IZELServerString& description)
{
    const ElementXml element("REPOSITORY", {
                                               {"name", toStdString(repositoryName)},
                                               {"description", toStdString(description)},
                                           });
    return addXmlValue(name, element, "REP_ADD_REPOSITORY");
}

int ZELServerTCPIPRequest::addUserTokenPayload(const std::string& name, const IZELServerUserToken& token)
{
    const auto* dates = dynamic_cast<const UserTokenPayloadFields*>(&token);
    const ElementXml element("USERTOKEN",
                             {
                                 {"token", textOf(token, &IZELServerUserToken::getToken)},
                                 {"clientaddress", textOf(token, &IZELServerUserToken::getClientAddress)},
                                 {"expirationtimeout", decimalText(token.getExpirationTimeout())},
                                 {"firsttokendate", dates != nullptr ? dates->firstTokenDate() : std::string()},
                                 {"lasttokendate", dates != nullptr ? dates->lastTokenDate() : std::string()},
                                 {"expirationdate", dates != nullptr ? dates->expirationDate() : std::string()},
                             });
    return addXmlValue(name, element, rootElementName_);
}

int ZELServerTCPIPRequest::addPathPayload(const std::string& name, const IZELServerPath& path)
{
    const ElementXml element("PATH", {
                                         {"name", textOf(path, &IZELServerPath::getName)},
                                         {"dirpath", textOf(path, &IZELServerPath::getDirectoryPath)},
                                         {"abspath", textOf(path, &IZELServerPath::getAbsolutePath)},
                                     });
    return addXmlValue(name, element, rootElementName_);
}

int ZELServerTCPIPRequest::addXmlValue(const std::string& name, const XmlWritable& object, const std::string& rootName)
{
    XmlDocument* document = xmlSupport();
    if (document == nullptr) {
        return static_cast<int>(msg::kXmlFailure);
    }
    const DocumentScope scope(*document);
    if (document->createDocument("", rootName) == nullptr) {
        return static_cast<int>(msg::kXmlFailure);
    }
    if (const unsigned code = object.writeXml(*document); code != 0) {
        return static_cast<int>(code);
    }
    std::string text;
    if (IZELServerStatus* failure = document->serialize(text)) {
        const unsigned code = failure->getMessageNumber();
        delete failure;
        return static_cast<int>(code);
    }
    appendValue(name, text);
    return 0;
}

unsigned ZELServerTCPIPRequest::appendDirectives(const IZELServerStringArray& list)
{
    return appendEntries(list, directiveList_);
}

unsigned ZELServerTCPIPRequest::getDirectives(IZELServerStringArray& out) const
{
    return copyEntries(directiveList_, out);
}

unsigned ZELServerTCPIPRequest::appendNotifications(const IZELServerStringArray& list)
{
    return appendEntries(list, notificationList_);
}

unsigned ZELServerTCPIPRequest::getNotifications(IZELServerStringArray& out) const
{
    return copyEntries(notificationList_, out);
}

}  // namespace zel
