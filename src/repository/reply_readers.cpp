#include "repository/reply_readers.h"

#include "repository/ZELServerRepository.h"
#include "repository/ZELServerService.h"
#include "repository/ZELServerWorkspace.h"
#include "repository/repository_objects.h"
#include "transport/object_reader.h"

namespace zel {
namespace {

// Every kind fills itself from its element.
template <class Concrete>
bool fill(Concrete& object, const XmlElement& element)
{
    return object.readFrom(element);
}

// Kinds that talk to the server are bound to the reply's channel before they read.
template <class Concrete>
auto boundFill(IZELServerChannel* channel)
{
    return [channel](Concrete& object, const XmlElement& element) {
        object.bindTo(channel);
        return object.readFrom(element);
    };
}

template <class Concrete>
auto make()
{
    return [] { return new Concrete(); };
}

template <class Concrete>
auto makeOn(IZELServerChannel* channel)
{
    return [channel] { return new Concrete(channel); };
}

constexpr const char* kSummaryTag = "WORKSPACE_SUMMARY";
constexpr const char* kWorkspaceTag = "WORKSPACE_DEFINITIONS";
constexpr const char* kCustomFormatTag = "CUSTOMFORMAT";
constexpr const char* kCustomTransformerTag = "CUSTOMTRANSFORMER";
constexpr const char* kResourceTag = "RESOURCE";
constexpr const char* kTemplateTag = "TEMPLATE";
constexpr const char* kItemTag = "ITEM";
constexpr const char* kServiceTag = "SERVICE";
constexpr const char* kWorkspaceServiceTag = "WORKSPACE_SERVICE";
constexpr const char* kRepositoryTag = "REPOSITORY";

}  // namespace

int readWorkspaceSummaryReply(std::string_view body, IZELServerWorkspaceSummary& summary)
{
    return readFirstObject<ZELServerWorkspaceSummary>(body, kSummaryTag, summary, fill<ZELServerWorkspaceSummary>);
}

int readWorkspaceSummariesReply(std::string_view body, IZELServerVector<IZELServerWorkspaceSummary>& summaries)
{
    return readObjectList(body, kSummaryTag, summaries, make<ZELServerWorkspaceSummary>(),
                          fill<ZELServerWorkspaceSummary>);
}

int readWorkspaceReply(std::string_view body, IZELServerChannel* channel, IZELServerWorkspace& workspace)
{
    return readFirstObject<ZELServerWorkspace>(body, kWorkspaceTag, workspace, boundFill<ZELServerWorkspace>(channel));
}

int readWorkspacesReply(std::string_view body, IZELServerChannel* channel,
                        IZELServerVector<IZELServerWorkspace>& workspaces)
{
    return readObjectList(body, kWorkspaceTag, workspaces, makeOn<ZELServerWorkspace>(channel),
                          fill<ZELServerWorkspace>);
}

int readCustomFormatReply(std::string_view body, IZELServerCustomFormat& format)
{
    return readFirstObject<ZELServerCustomFormat>(body, kCustomFormatTag, format, fill<ZELServerCustomFormat>);
}

int readCustomFormatsReply(std::string_view body, IZELServerVector<IZELServerCustomFormat>& formats)
{
    return readObjectList(body, kCustomFormatTag, formats, make<ZELServerCustomFormat>(), fill<ZELServerCustomFormat>);
}

int readCustomTransformerReply(std::string_view body, IZELServerCustomTransformer& transformer)
{
    return readFirstObject<ZELServerCustomTransformer>(body, kCustomTransformerTag, transformer,
                                                       fill<ZELServerCustomTransformer>);
}

int readCustomTransformersReply(std::string_view body, IZELServerVector<IZELServerCustomTransformer>& transformers)
{
    return readObjectList(body, kCustomTransformerTag, transformers, make<ZELServerCustomTransformer>(),
                          fill<ZELServerCustomTransformer>);
}

int readResourceReply(std::string_view body, IZELServerResource& resource)
{
    return readFirstObject<ZELServerResource>(body, kResourceTag, resource, fill<ZELServerResource>);
}

int readResourcesReply(std::string_view body, IZELServerVector<IZELServerResource>& resources)
{
    return readObjectList(body, kResourceTag, resources, make<ZELServerResource>(), fill<ZELServerResource>);
}

int readTemplateReply(std::string_view body, IZELServerTemplate& templ)
{
    return readFirstObject<ZELServerTemplate>(body, kTemplateTag, templ, fill<ZELServerTemplate>);
}

int readTemplatesReply(std::string_view body, IZELServerVector<IZELServerTemplate>& templates)
{
    return readObjectList(body, kTemplateTag, templates, make<ZELServerTemplate>(), fill<ZELServerTemplate>);
}

int readItemReply(std::string_view body, IZELServerItem& item)
{
    return readFirstObject<ZELServerItem>(body, kItemTag, item, fill<ZELServerItem>);
}

int readItemsReply(std::string_view body, IZELServerVector<IZELServerItem>& items)
{
    return readObjectList(body, kItemTag, items, make<ZELServerItem>(), fill<ZELServerItem>);
}

int readServiceReply(std::string_view body, IZELServerChannel* channel, IZELServerService& service)
{
    return readFirstObject<ZELServerService>(body, kServiceTag, service, boundFill<ZELServerService>(channel));
}

int readServicesReply(std::string_view body, IZELServerChannel* channel, IZELServerVector<IZELServerService>& services)
{
    return readObjectList(body, kServiceTag, services, makeOn<ZELServerService>(channel), fill<ZELServerService>);
}

int readWorkspaceServiceReply(std::string_view body, IZELServerChannel* channel,
                              IZELServerWorkspaceService& workspaceService)
{
    return readFirstObject<ZELServerWorkspaceService>(body, kWorkspaceServiceTag, workspaceService,
                                                      boundFill<ZELServerWorkspaceService>(channel));
}

int readWorkspaceServicesReply(std::string_view body, IZELServerChannel* channel,
                               IZELServerVector<IZELServerWorkspaceService>& workspaceServices)
{
    return readObjectList(body, kWorkspaceServiceTag, workspaceServices, makeOn<ZELServerWorkspaceService>(channel),
                          fill<ZELServerWorkspaceService>);
}

int readRepositoryReply(std::string_view body, IZELServerChannel* channel, IZELServerRepository& repository)
{
    return readFirstObject<ZELServerRepository>(body, kRepositoryTag, repository,
                                                boundFill<ZELServerRepository>(channel));
}

int readRepositoriesReply(std::string_view body, IZELServerChannel* channel,
                          IZELServerVector<IZELServerRepository>& repositories)
{
    return readObjectList(body, kRepositoryTag, repositories, makeOn<ZELServerRepository>(channel),
                          fill<ZELServerRepository>);
}

}  // namespace zel
