#pragma once
// The repository object kinds' readers over a reply body, behind the response's object readers (and
// the item list, which the response has no slot for). Each is one call of the shared machinery in
// transport/object_reader.h with the kind's tag and fill function, so they share its results: 0; the
// parser's message number when the body is not XML; 393621 when there is no document element, no
// element of the tag (single readers), or the object given is not the library's own.
//
// Single readers fill the given object from the first element of the tag anywhere in the document.
// List readers destroy what the vector held, then append one new object per element of the tag, in
// document order. Objects that talk to the server are bound to `channel`, the reply's channel.

#include <string_view>

#include <zelserverapi/IZELServerCustomFormat.h>
#include <zelserverapi/IZELServerCustomTransformer.h>
#include <zelserverapi/IZELServerItem.h>
#include <zelserverapi/IZELServerRepository.h>
#include <zelserverapi/IZELServerResource.h>
#include <zelserverapi/IZELServerService.h>
#include <zelserverapi/IZELServerTemplate.h>
#include <zelserverapi/IZELServerVector.h>
#include <zelserverapi/IZELServerWorkspace.h>
#include <zelserverapi/IZELServerWorkspaceService.h>
#include <zelserverapi/IZELServerWorkspaceSummary.h>

#include "transport/IZELServerChannel.h"

namespace zel {

int readWorkspaceSummaryReply(std::string_view body, IZELServerWorkspaceSummary& summary);
int readWorkspaceSummariesReply(std::string_view body, IZELServerVector<IZELServerWorkspaceSummary>& summaries);

int readWorkspaceReply(std::string_view body, IZELServerChannel* channel, IZELServerWorkspace& workspace);
int readWorkspacesReply(std::string_view body, IZELServerChannel* channel,
                        IZELServerVector<IZELServerWorkspace>& workspaces);

int readCustomFormatReply(std::string_view body, IZELServerCustomFormat& format);
int readCustomFormatsReply(std::string_view body, IZELServerVector<IZELServerCustomFormat>& formats);

int readCustomTransformerReply(std::string_view body, IZELServerCustomTransformer& transformer);
int readCustomTransformersReply(std::string_view body, IZELServerVector<IZELServerCustomTransformer>& transformers);

int readResourceReply(std::string_view body, IZELServerResource& resource);
int readResourcesReply(std::string_view body, IZELServerVector<IZELServerResource>& resources);

int readTemplateReply(std::string_view body, IZELServerTemplate& templ);
int readTemplatesReply(std::string_view body, IZELServerVector<IZELServerTemplate>& templates);

int readItemReply(std::string_view body, IZELServerItem& item);
int readItemsReply(std::string_view body, IZELServerVector<IZELServerItem>& items);

int readServiceReply(std::string_view body, IZELServerChannel* channel, IZELServerService& service);
int readServicesReply(std::string_view body, IZELServerChannel* channel, IZELServerVector<IZELServerService>& services);

int readWorkspaceServiceReply(std::string_view body, IZELServerChannel* channel,
                              IZELServerWorkspaceService& workspaceService);
int readWorkspaceServicesReply(std::string_view body, IZELServerChannel* channel,
                               IZELServerVector<IZELServerWorkspaceService>& workspaceServices);

int readRepositoryReply(std::string_view body, IZELServerChannel* channel, IZELServerRepository& repository);
int readRepositoriesReply(std::string_view body, IZELServerChannel* channel,
                          IZELServerVector<IZELServerRepository>& repositories);

}  // namespace zel
