#include "repository/repository_factories.h"

#include "api/ZELServerString.h"
#include "api/ZELServerVector.h"
#include "repository/ZELServerPropertyAccessor.h"
#include "repository/ZELServerRepository.h"
#include "repository/ZELServerRepositoryManager.h"
#include "repository/ZELServerService.h"
#include "repository/ZELServerWorkspace.h"
#include "repository/repository_objects.h"

namespace zel {

IZELServerRepositoryManager* makeRepositoryManager(IZELServerChannel* channel)
{
    return new ZELServerRepositoryManager(channel);
}

IZELServerService* makeService(IZELServerChannel* channel, const IZELServerString& name,
                               const IZELServerString& displayName, const IZELServerString& description,
                               const IZELServerString& urlPattern)
{
    // A new service from the session is enabled and takes workspaces, and nothing else, until told.
    return new ZELServerService(channel, toStdString(name), toStdString(displayName), toStdString(description),
                                toStdString(urlPattern), true, true, false, false, false);
}

IZELServerService* makeService(IZELServerChannel* channel) { return new ZELServerService(channel); }
IZELServerWorkspace* makeWorkspace(IZELServerChannel* channel) { return new ZELServerWorkspace(channel); }
IZELServerRepository* makeRepository(IZELServerChannel* channel) { return new ZELServerRepository(channel); }
IZELServerWorkspaceService* makeWorkspaceService(IZELServerChannel* channel)
{
    return new ZELServerWorkspaceService(channel);
}
IZELServerWorkspaceSummary* makeWorkspaceSummary() { return new ZELServerWorkspaceSummary(); }
IZELServerCustomFormat* makeCustomFormat() { return new ZELServerCustomFormat(); }
IZELServerCustomTransformer* makeCustomTransformer() { return new ZELServerCustomTransformer(); }
IZELServerResource* makeResource() { return new ZELServerResource(); }
IZELServerTemplate* makeTemplate() { return new ZELServerTemplate(); }
IZELServerPropertyAccessor* makePropertyAccessor() { return new ZELServerPropertyAccessor(); }

IZELServerVector<IZELServerService>* makeServiceVector()
{
    return new ZELServerVector<IZELServerService, ZELServerService>();
}
IZELServerVector<IZELServerWorkspace>* makeWorkspaceVector()
{
    return new ZELServerVector<IZELServerWorkspace, ZELServerWorkspace>();
}
IZELServerVector<IZELServerRepository>* makeRepositoryVector()
{
    return new ZELServerVector<IZELServerRepository, ZELServerRepository>();
}
IZELServerVector<IZELServerWorkspaceSummary>* makeWorkspaceSummaryVector()
{
    return new ZELServerVector<IZELServerWorkspaceSummary, ZELServerWorkspaceSummary>();
}
IZELServerVector<IZELServerWorkspaceService>* makeWorkspaceServiceVector()
{
    return new ZELServerVector<IZELServerWorkspaceService, ZELServerWorkspaceService>();
}
IZELServerVector<IZELServerCustomFormat>* makeCustomFormatVector()
{
    return new ZELServerVector<IZELServerCustomFormat, ZELServerCustomFormat>();
}
IZELServerVector<IZELServerCustomTransformer>* makeCustomTransformerVector()
{
    return new ZELServerVector<IZELServerCustomTransformer, ZELServerCustomTransformer>();
}
IZELServerVector<IZELServerResource>* makeResourceVector()
{
    return new ZELServerVector<IZELServerResource, ZELServerResource>();
}
IZELServerVector<IZELServerProperty>* makePropertyVector()
{
    return new ZELServerVector<IZELServerProperty, ZELServerProperty>();
}
IZELServerVector<IZELServerTemplate>* makeTemplateVector()
{
    return new ZELServerVector<IZELServerTemplate, ZELServerTemplate>();
}
IZELServerVector<IZELServerItem>* makeItemVector() { return new ZELServerVector<IZELServerItem, ZELServerItem>(); }

}  // namespace zel
