#pragma once
// The response of the TCP/IP channel: the body of one reply and its readers. Made and destroyed only
// by the channel; the object readers all go through object_reader.h.

#include <string>

#include "api/heap.h"
#include "transport/IZELServerChannel.h"
#include "transport/IZELServerResponse.h"

namespace zel {

class ZELServerResponse final : public IZELServerResponse, public HeapObject {
public:
    // `channel` is not owned; objects read here that talk to the server are bound to it.
    explicit ZELServerResponse(IZELServerChannel* channel) : channel_(channel) {}
    ~ZELServerResponse() override = default;
    ZELServerResponse(const ZELServerResponse&) = delete;
    ZELServerResponse& operator=(const ZELServerResponse&) = delete;

    IZELServerChannel* channel() const { return channel_; }

    int setBody(const std::string& body) override;
    int getBody(std::string& out) const override;
    int readBoolean(unsigned& flag) const override;
    int readWorkspaceSummary(IZELServerWorkspaceSummary& summary) const override;
    int readWorkspace(IZELServerWorkspace& workspace) const override;
    int readWorkspaces(IZELServerVector<IZELServerWorkspace>& workspaces) const override;
    int readCustomFormat(IZELServerCustomFormat& format) const override;
    int readCustomFormats(IZELServerVector<IZELServerCustomFormat>& formats) const override;
    int readCustomTransformer(IZELServerCustomTransformer& transformer) const override;
    int readCustomTransformers(IZELServerVector<IZELServerCustomTransformer>& transformers) const override;
    int readResource(IZELServerResource& resource) const override;
    int readResources(IZELServerVector<IZELServerResource>& resources) const override;
    int readWorkspaceService(IZELServerWorkspaceService& workspaceService) const override;
    int readService(IZELServerService& service) const override;
    int readServices(IZELServerVector<IZELServerService>& services) const override;
    int readRepository(IZELServerRepository& repository) const override;
    int readRepositories(IZELServerVector<IZELServerRepository>& repositories) const override;
    // 0 also when the reply names no identity: `identity` is then destroyed and null. Only a body that
    // does not parse (its parser's code) or an identity that cannot be made (393621) fail.
    int readSessionInit(IZELServerIdentity*& identity, ZELServerStringDict& settings) const override;
    int readLogFileInfo(IZELServerLogFileInfo& info) const override;
    int readTemplate(IZELServerTemplate& templ) const override;
    int readTemplates(IZELServerVector<IZELServerTemplate>& templates) const override;
    int readItem(IZELServerItem& item) const override;
    int readUserToken(IZELServerUserToken& token) const override;
    int readMountPoint(IZELServerMountPoint& mountPoint) const override;
    int readMountPoints(IZELServerVector<IZELServerMountPoint>& mountPoints) const override;
    int readFileInfo(IZELServerFileInfo& info) const override;
    int readFileInfos(IZELServerVector<IZELServerFileInfo>& infos) const override;

private:
    IZELServerChannel* channel_;
    std::string body_;
};

}  // namespace zel
