#pragma once
// One server command on its way out: the keyword, then named values, some of them XML documents.
// Requests are made and destroyed only by the channel (IZELServerChannel::createRequest /
// destroyRequest). Values are written as given: a value must not contain a NUL byte, because NUL
// separates the named values on the wire.

#include <string>
#include <string_view>

#include <zelserverapi/IZELServerString.h>
#include <zelserverapi/IZELServerStringArray.h>

class IZELServerService;
class IZELServerUserToken;
class IZELServerPath;

namespace zel {

class XmlDocument;

// An object that can write itself as elements below a document's root (see addXmlValue).
class XmlWritable {
public:
    virtual ~XmlWritable() = default;
    // Adds the object's elements to `document`, whose root element already exists. 0 or a message number.
    virtual unsigned writeXml(XmlDocument& document) const = 0;
};

class IZELServerRequest {
public:
    // The request text as it goes on the wire: keyword, then NUL name "=" value per named value.
    virtual int getText(std::string& out) const = 0;
    // The same text without a copy, valid until the request is changed or destroyed.
    virtual std::string_view textView() const = 0;
    virtual int addValue(const std::string& name, const IZELServerString& value) = 0;
    virtual int addValue(const std::string& name, const std::string& value) = 0;
    virtual int addValue(const IZELServerString& name, const IZELServerString& value) = 0;
    // Writes "true" when `flag` is exactly 1, "false" for any other value.
    virtual int addBooleanValue(const std::string& name, unsigned flag) = 0;
    // Adds each (name, value) pair of a flat list as a named value; the list's own name is not
    // written, an odd last entry is ignored.
    virtual int addValueList(const std::string& name, const IZELServerStringArray& list) = 0;
    virtual int addValueList(const IZELServerString& name, const IZELServerStringArray& list) = 0;
    // The "serviceObject" document: root "REP_ADD_SERVICE", one "SERVICE" element.
    virtual int addServicePayload(const std::string& name, const IZELServerService& service) = 0;
    // The "repositoryObject" document: root "REP_ADD_REPOSITORY", one "REPOSITORY" element.
    virtual int addRepositoryPayload(const std::string& name, const IZELServerString& repositoryName,
                                     const IZELServerString& description) = 0;
    // Builds a document with root `rootName`, lets `object` write into it, and adds the serialised text
    // as value `name`. 0, or 393620 / the serialiser's message number.
    virtual int addXmlValue(const std::string& name, const XmlWritable& object, const std::string& rootName) = 0;
    // Directive and notification pair lists, kept for the result-port exchange. Return the count added.
    virtual unsigned appendDirectives(const IZELServerStringArray& list) = 0;
    virtual unsigned getDirectives(IZELServerStringArray& out) const = 0;
    virtual unsigned appendNotifications(const IZELServerStringArray& list) = 0;
    virtual unsigned getNotifications(IZELServerStringArray& out) const = 0;
    // The "USERTOKEN" document under value `name`.
    virtual int addUserTokenPayload(const std::string& name, const IZELServerUserToken& token) = 0;
    // The "PATH" document under value `name`.
    virtual int addPathPayload(const std::string& name, const IZELServerPath& path) = 0;
    virtual ~IZELServerRequest() = default;

protected:
    IZELServerRequest() = default;
};

}  // namespace zel
