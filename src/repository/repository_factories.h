#pragma once
// What the session makes of this subsystem. Each returns a new object the caller owns (destroyed
// through its interface), or null when memory is exhausted. Objects that talk to the server borrow
// `channel`, which must outlive them; a null channel makes their commands fail with 393622.

#include <zelserverapi/IZELServerCustomFormat.h>
#include <zelserverapi/IZELServerCustomTransformer.h>
#include <zelserverapi/IZELServerItem.h>
#include <zelserverapi/IZELServerProperty.h>
#include <zelserverapi/IZELServerPropertyAccessor.h>
#include <zelserverapi/IZELServerRepository.h>
#include <zelserverapi/IZELServerRepositoryManager.h>
#include <zelserverapi/IZELServerResource.h>
#include <zelserverapi/IZELServerService.h>
#include <zelserverapi/IZELServerString.h>
#include <zelserverapi/IZELServerTemplate.h>
#include <zelserverapi/IZELServerVector.h>
#include <zelserverapi/IZELServerWorkspace.h>
#include <zelserverapi/IZELServerWorkspaceService.h>
#include <zelserverapi/IZELServerWorkspaceSummary.h>

#include "transport/IZELServerChannel.h"

namespace zel {

IZELServerRepositoryManager* makeRepositoryManager(IZELServerChannel* channel);

// A service with the four texts, the id "-1" and every flag 0.
IZELServerService* makeService(IZELServerChannel* channel, const IZELServerString& name,
                               const IZELServerString& displayName, const IZELServerString& description,
                               const IZELServerString& urlPattern);
// An empty service: the id "-1", empty texts and every flag 0.
IZELServerService* makeService(IZELServerChannel* channel);
IZELServerWorkspace* makeWorkspace(IZELServerChannel* channel);
// An empty repository (no name, no description), to be filled by the manager's getRepository.
IZELServerRepository* makeRepository(IZELServerChannel* channel);
IZELServerWorkspaceService* makeWorkspaceService(IZELServerChannel* channel);
IZELServerWorkspaceSummary* makeWorkspaceSummary();
IZELServerCustomFormat* makeCustomFormat();
IZELServerCustomTransformer* makeCustomTransformer();
IZELServerResource* makeResource();
IZELServerTemplate* makeTemplate();
IZELServerPropertyAccessor* makePropertyAccessor();

// Empty owning vectors of each kind, as the list operations fill them.
IZELServerVector<IZELServerService>* makeServiceVector();
IZELServerVector<IZELServerWorkspace>* makeWorkspaceVector();
IZELServerVector<IZELServerRepository>* makeRepositoryVector();
IZELServerVector<IZELServerWorkspaceSummary>* makeWorkspaceSummaryVector();
IZELServerVector<IZELServerWorkspaceService>* makeWorkspaceServiceVector();
IZELServerVector<IZELServerCustomFormat>* makeCustomFormatVector();
IZELServerVector<IZELServerCustomTransformer>* makeCustomTransformerVector();
IZELServerVector<IZELServerResource>* makeResourceVector();
IZELServerVector<IZELServerProperty>* makePropertyVector();
IZELServerVector<IZELServerTemplate>* makeTemplateVector();
IZELServerVector<IZELServerItem>* makeItemVector();

}  // namespace zel
