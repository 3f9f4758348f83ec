#pragma once
// The body of one server reply and the readers that turn it into typed results. Responses are made
// and destroyed only by the channel (IZELServerChannel::createResponse / destroyResponse).
//
// Every object reader parses the body as XML and hands the document element to the object kind's own
// reader. They return 0 when the object was filled, the parser's message number (393620) when the
// body is not XML, and 393621 when there is no document element or the object's reader refused it.
// A pair of readers for one kind fills a single object (first) or a vector (second; cleared first).

#include <string>

#include <zelserverapi/IZELServerString.h>
#include <zelserverapi/IZELServerVector.h>
#include <zelserverapi/ZELServerStringDict.h>

class IZELServerIdentity;
class IZELServerWorkspaceSummary;
class IZELServerWorkspace;
class IZELServerCustomFormat;
class IZELServerCustomTransformer;
class IZELServerResource;
class IZELServerWorkspaceService;
class IZELServerService;
class IZELServerRepository;
class IZELServerLogFileInfo;
class IZELServerTemplate;
class IZELServerItem;
class IZELServerUserToken;
class IZELServerMountPoint;
class IZELServerFileInfo;

namespace zel {

class IZELServerResponse {
public:
    virtual int setBody(const std::string& body) = 0;
    virtual int getBody(std::string& out) const = 0;
    // Exactly "true" gives 1, exactly "false" gives 0; anything else returns 393604, flag untouched.
    virtual int readBoolean(unsigned& flag) const = 0;
    virtual int readWorkspaceSummary(IZELServerWorkspaceSummary& summary) const = 0;
    virtual int readWorkspace(IZELServerWorkspace& workspace) const = 0;
    virtual int readWorkspaces(IZELServerVector<IZELServerWorkspace>& workspaces) const = 0;
    virtual int readCustomFormat(IZELServerCustomFormat& format) const = 0;
    virtual int readCustomFormats(IZELServerVector<IZELServerCustomFormat>& formats) const = 0;
    virtual int readCustomTransformer(IZELServerCustomTransformer& transformer) const = 0;
    virtual int readCustomTransformers(IZELServerVector<IZELServerCustomTransformer>& transformers) const = 0;
    virtual int readResource(IZELServerResource& resource) const = 0;
    virtual int readResources(IZELServerVector<IZELServerResource>& resources) const = 0;
    virtual int readWorkspaceService(IZELServerWorkspaceService& workspaceService) const = 0;
    virtual int readService(IZELServerService& service) const = 0;
    virtual int readServices(IZELServerVector<IZELServerService>& services) const = 0;
    // Repositories read here are bound to the response's channel.
    virtual int readRepository(IZELServerRepository& repository) const = 0;
    virtual int readRepositories(IZELServerVector<IZELServerRepository>& repositories) const = 0;
    // The sign-in reply: stores "security_enabled" / "security_pubparm" of the document element under
    // "SECURITY_ENABLED" / "SECURITY_PUBPARM", then fills `identity` from "IDENTITY", or replaces it
    // with a single sign-on identity read from "SSO_IDENTITY", or destroys it (null) when neither.
    virtual int readSessionInit(IZELServerIdentity*& identity, ZELServerStringDict& settings) const = 0;
    virtual int readLogFileInfo(IZELServerLogFileInfo& info) const = 0;
    virtual int readTemplate(IZELServerTemplate& templ) const = 0;
    virtual int readTemplates(IZELServerVector<IZELServerTemplate>& templates) const = 0;
    virtual int readItem(IZELServerItem& item) const = 0;
    virtual int readUserToken(IZELServerUserToken& token) const = 0;
    // Shared resources and file information read here are bound to the response's channel.
    virtual int readMountPoint(IZELServerMountPoint& mountPoint) const = 0;
    virtual int readMountPoints(IZELServerVector<IZELServerMountPoint>& mountPoints) const = 0;
    virtual int readFileInfo(IZELServerFileInfo& info) const = 0;
    virtual int readFileInfos(IZELServerVector<IZELServerFileInfo>& infos) const = 0;
    virtual ~IZELServerResponse() = default;

protected:
    IZELServerResponse() = default;
};

}  // namespace zel
