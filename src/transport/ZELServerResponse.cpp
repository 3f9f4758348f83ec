#include "transport/ZELServerResponse.h"

#include "api/message_numbers.h"
#include "jobs/ZELServerLogFileInfo.h"
#include "repository/reply_readers.h"
#include "security/ZELServerIdentity.h"
#include "security/ZELServerUserToken.h"
#include "sharedresources/shared_resource_readers.h"
#include "transport/object_reader.h"
#include "transport/xml_navigation.h"

namespace zel {
namespace {

void storeSetting(const XmlElement& root, const char* attribute, const char* key, ZELServerStringDict& settings)
{
    std::string value;
    if (getAttribute(&root, attribute, value)) {
        settings.insert(key, value);
    }
}

// The reply decides the identity's kind: "IDENTITY" refills the one the channel holds, "SSO_IDENTITY"
// replaces it with a single sign-on identity, and a reply with neither leaves the channel without
// one. False only when memory runs out.
bool takeIdentity(const XmlElement& root, IZELServerIdentity*& identity)
{
    if (const XmlElement* element = findChild(&root, "IDENTITY")) {
        if (identity == nullptr) {
            identity = new ZELServerIdentity();
        }
        if (identity == nullptr) {
            return false;
        }
        identity->readFromXml(*element->node());
        return true;
    }
    delete identity;
    identity = nullptr;
    const XmlElement* element = findChild(&root, "SSO_IDENTITY");
    if (element == nullptr) {
        return true;
    }
    auto* replacement = new ZELServerSingleSignOnIdentity();
    if (replacement == nullptr) {
        return false;
    }
    replacement->readFromXml(*element->node());
    identity = replacement;
    return true;
}

}  // namespace

int ZELServerResponse::setBody(const std::string& body)
{
    body_ = body;
    return 0;
}

int ZELServerResponse::getBody(std::string& out) const
{
    out = body_;
    return 0;
}

int ZELServerResponse::readBoolean(unsigned& flag) const
{
    if (body_ == "true") {
        flag = 1;
    } else if (body_ == "false") {
        flag = 0;
    } else {
        return static_cast<int>(msg::kUnexpectedReply);
    }
    return 0;
}

int ZELServerResponse::readSessionInit(IZELServerIdentity*& identity, ZELServerStringDict& settings) const
{
    return readReplyDocument(body_, [&](const XmlElement& root) {
        storeSetting(root, "security_enabled", "SECURITY_ENABLED", settings);
        storeSetting(root, "security_pubparm", "SECURITY_PUBPARM", settings);
        return takeIdentity(root, identity);
    });
}

// Each object kind's reader lives with its subsystem, as one call of the machinery in
// object_reader.h; kinds that talk to the server are bound to this response's channel.

int ZELServerResponse::readWorkspaceSummary(IZELServerWorkspaceSummary& summary) const
{
    return readWorkspaceSummaryReply(body_, summary);
}

int ZELServerResponse::readWorkspace(IZELServerWorkspace& workspace) const
{
    return readWorkspaceReply(body_, channel_, workspace);
}

int ZELServerResponse::readWorkspaces(IZELServerVector<IZELServerWorkspace>& workspaces) const
{
    return readWorkspacesReply(body_, channel_, workspaces);
}

int ZELServerResponse::readCustomFormat(IZELServerCustomFormat& format) const
{
    return readCustomFormatReply(body_, format);
}

int ZELServerResponse::readCustomFormats(IZELServerVector<IZELServerCustomFormat>& formats) const
{
    return readCustomFormatsReply(body_, formats);
}

int ZELServerResponse::readCustomTransformer(IZELServerCustomTransformer& transformer) const
{
    return readCustomTransformerReply(body_, transformer);
}

int ZELServerResponse::readCustomTransformers(IZELServerVector<IZELServerCustomTransformer>& transformers) const
{
    return readCustomTransformersReply(body_, transformers);
}

int ZELServerResponse::readResource(IZELServerResource& resource) const { return readResourceReply(body_, resource); }

int ZELServerResponse::readResources(IZELServerVector<IZELServerResource>& resources) const
{
    return readResourcesReply(body_, resources);
}

int ZELServerResponse::readWorkspaceService(IZELServerWorkspaceService& workspaceService) const
{
    return readWorkspaceServiceReply(body_, channel_, workspaceService);
}

int ZELServerResponse::readService(IZELServerService& service) const
{
    return readServiceReply(body_, channel_, service);
}

int ZELServerResponse::readServices(IZELServerVector<IZELServerService>& services) const
{
    return readServicesReply(body_, channel_, services);
}

int ZELServerResponse::readRepository(IZELServerRepository& repository) const
{
    return readRepositoryReply(body_, channel_, repository);
}

int ZELServerResponse::readRepositories(IZELServerVector<IZELServerRepository>& repositories) const
{
    return readRepositoriesReply(body_, channel_, repositories);
}

int ZELServerResponse::readLogFileInfo(IZELServerLogFileInfo& info) const { return readLogFileInfoReply(body_, info); }

int ZELServerResponse::readTemplate(IZELServerTemplate& templ) const { return readTemplateReply(body_, templ); }

int ZELServerResponse::readTemplates(IZELServerVector<IZELServerTemplate>& templates) const
{
    return readTemplatesReply(body_, templates);
}

int ZELServerResponse::readItem(IZELServerItem& item) const { return readItemReply(body_, item); }

int ZELServerResponse::readUserToken(IZELServerUserToken& token) const { return readUserTokenReply(body_, token); }

int ZELServerResponse::readMountPoint(IZELServerMountPoint& mountPoint) const
{
    return readMountPointReply(body_, channel_, mountPoint);
}

int ZELServerResponse::readMountPoints(IZELServerVector<IZELServerMountPoint>& mountPoints) const
{
    return readMountPointsReply(body_, channel_, mountPoints);
}

int ZELServerResponse::readFileInfo(IZELServerFileInfo& info) const { return readFileInfoReply(body_, info); }

int ZELServerResponse::readFileInfos(IZELServerVector<IZELServerFileInfo>& infos) const
{
    return readFileInfosReply(body_, infos);
}

}  // namespace zel
