#include "repository/ZELServerRepository.h"

#include <optional>

#include "api/exception_guard.h"
#include "api/ZELServerString.h"
#include "api/ZELServerStringArray.h"
#include "api/message_numbers.h"
#include "api/status.h"
#include "transport/attribute_binding.h"
#include "repository/reply_readers.h"

namespace zel {
namespace {

constexpr AttributeBinding<RepositoryFields> kRepositoryAttributes[] = {
    {"name", &RepositoryFields::name},
    {"description", &RepositoryFields::description},
};

// The client never asks the server to check a transferred file against a CRC, whatever the file
// transfer itself sends.
constexpr const char* kNoCrcCheck = "false";

// The directive list of the views that list everything, whatever the caller's directives say.
ZELServerStringArray allObjects() { return ZELServerStringArray({"enableFilter", "All"}); }

// The registrations list differs: a missing filter means all, and "WORKSPACE_NAME" narrows the list
// to one workspace. Nullopt for an unknown filter value.
std::optional<ZELServerStringArray> registrationFilterOf(const ZELServerStringDict* directives)
{
    if (directives == nullptr) {
        return allObjects();
    }
    std::string filter = "All";
    if (directives->contains("ENABLE_FILTER")) {
        filter = enableFilterFor(*directives);
        if (filter.empty()) {
            return std::nullopt;
        }
    }
    if (const std::string* workspace = directives->find("WORKSPACE_NAME")) {
        return ZELServerStringArray({"enableFilter", filter, "workspaceName", *workspace});
    }
    return ZELServerStringArray({"enableFilter", filter});
}

std::string bodyOf(const IZELServerResponse& response)
{
    std::string body;
    response.getBody(body);
    return body;
}

}  // namespace

ZELServerRepository::ZELServerRepository(IZELServerChannel* channel, const IZELServerString& name,
                                         const IZELServerString& description)
    : channel_(channel)
{
    fields_.name = toStdString(name);
    fields_.description = toStdString(description);
}

void ZELServerRepository::getName(IZELServerString& out) const { handOutText(fields_.name, out); }
void ZELServerRepository::getDescription(IZELServerString& out) const { handOutText(fields_.description, out); }

bool ZELServerRepository::readFrom(const XmlElement& element)
{
    readAttributes(element, fields_, kRepositoryAttributes);
    return true;
}

CheckedCommand ZELServerRepository::on(const char* keyword, Where where) const
{
    CheckedCommand command(channel_, keyword, where);
    command.add("repositoryName", fields_.name);
    return command;
}

// ---- Items ------------------------------------------------------------------------------------------

IZELServerStatus* ZELServerRepository::itemExists(const IZELServerString& itemName, unsigned& exists)
{
    return guarded([&] {
        return on("REP_ITEMEXISTS")
            .require(itemName)
            .check(allowedName(itemName))
            .add("itemName", itemName)
            .askFlag(exists);
    });
}

IZELServerStatus* ZELServerRepository::getItem(const IZELServerString& itemName,
                                               const IZELServerString& destinationPath, unsigned& received,
                                               IZELServerProgressListener* listener)
{
    return guarded([&] {
        const std::string item = toStdString(itemName);
        return on("REP_GET_ITEM")
            .require(itemName)
            .require(destinationPath)
            .check(allowedName(itemName))
            .add("itemName", item)
            .add("itemFileCRCCheckingEnabled", kNoCrcCheck)
            .download({toStdString(destinationPath), item, true}, received, listener);
    });
}

IZELServerStatus* ZELServerRepository::getItem(const IZELServerString& itemName,
                                               const IZELServerString& destinationPath, unsigned& received)
{
    return getItem(itemName, destinationPath, received, nullptr);
}

IZELServerStatus* ZELServerRepository::addItem(const IZELServerString& itemName, const IZELServerString& sourcePath,
                                               IZELServerProgressListener* listener)
{
    return guarded([&] {
        return on("REP_ADD_ITEM")
            .require(itemName)
            .require(sourcePath)
            .check(allowedName(itemName))
            .add("itemName", itemName)
            .add("itemFileCRCCheckingEnabled", kNoCrcCheck)
            .upload(sourcePath, listener);
    });
}

IZELServerStatus* ZELServerRepository::addItem(const IZELServerString& itemName, const IZELServerString& sourcePath)
{
    return addItem(itemName, sourcePath, nullptr);
}

// Only emptiness is checked here, unlike addItem: an item already on the server is replaced under
// whatever name it has.
IZELServerStatus* ZELServerRepository::updateItem(const IZELServerString& itemName, const IZELServerString& sourcePath,
                                                  IZELServerProgressListener* listener)
{
    return guarded([&] {
        return on("REP_UPDATE_ITEM")
            .require(itemName)
            .require(sourcePath)
            .add("itemName", itemName)
            .add("itemFileCRCCheckingEnabled", kNoCrcCheck)
            .upload(sourcePath, listener);
    });
}

IZELServerStatus* ZELServerRepository::updateItem(const IZELServerString& itemName, const IZELServerString& sourcePath)
{
    return updateItem(itemName, sourcePath, nullptr);
}

IZELServerStatus* ZELServerRepository::removeItem(const IZELServerString& itemName, unsigned& removed)
{
    return guarded([&] {
        return on("REP_REMOVE_ITEM")
            .require(itemName)
            .check(allowedName(itemName))
            .add("itemName", itemName)
            .askFlag(removed);
    });
}

// ---- Item resources ---------------------------------------------------------------------------------

IZELServerStatus* ZELServerRepository::itemResourceExists(const IZELServerString& itemName,
                                                          const IZELServerString& resourceName, unsigned& exists)
{
    return guarded([&] { return askItemResource("REP_ITEMRESOURCEEXISTS", itemName, resourceName, exists); });
}

IZELServerStatus* ZELServerRepository::getItemResource(const IZELServerString& itemName,
                                                       const IZELServerString& resourceName,
                                                       const IZELServerString& destinationPath, unsigned& received,
                                                       IZELServerProgressListener* listener)
{
    return guarded([&] {
        // Unlike an item, an empty resource is a resource.
        return on("REP_GET_ITEMRESOURCE")
            .require(itemName)
            .require(resourceName)
            .require(destinationPath)
            .check(allowedName(itemName))
            .check(allowedName(resourceName))
            .add("itemName", itemName)
            .add("resourceName", resourceName)
            .add("resourceFileCRCCheckingEnabled", kNoCrcCheck)
            .download({toStdString(destinationPath), toStdString(resourceName)}, received, listener);
    });
}

IZELServerStatus* ZELServerRepository::getItemResource(const IZELServerString& itemName,
                                                       const IZELServerString& resourceName,
                                                       const IZELServerString& destinationPath, unsigned& received)
{
    return getItemResource(itemName, resourceName, destinationPath, received, nullptr);
}

// Only the item name is checked: the resource name goes to the server as given.
IZELServerStatus* ZELServerRepository::getItemResourceView(const IZELServerString& itemName,
                                                           const IZELServerString& resourceName,
                                                           IZELServerResource& resource, unsigned& found)
{
    return guarded([&]() -> IZELServerStatus* {
        return on("REP_GET_ITEMRESOURCEVIEW")
            .require(itemName)
            .add("itemName", itemName)
            .add("resourceName", resourceName)
            .askObject(found, [&](const IZELServerResponse& response) { return response.readResource(resource); });
    });
}

// Asking whether a resource exists and removing it differ only in their keyword.
IZELServerStatus* ZELServerRepository::askItemResource(const char* keyword, const IZELServerString& itemName,
                                                       const IZELServerString& resourceName, unsigned& answer,
                                                       Where where)
{
    return on(keyword, where)
        .require(itemName)
        .require(resourceName)
        .check(allowedName(itemName))
        .check(allowedName(resourceName))
        .add("itemName", itemName)
        .add("resourceName", resourceName)
        .askFlag(answer);
}

// Adding and replacing a resource differ only in their keyword.
IZELServerStatus* ZELServerRepository::sendItemResource(const char* keyword, const IZELServerString& itemName,
                                                        const IZELServerString& resourceName,
                                                        const IZELServerString& sourcePath,
                                                        IZELServerProgressListener* listener, Where where)
{
    return on(keyword, where)
        .require(itemName)
        .require(resourceName)
        .require(sourcePath)
        .check(allowedName(itemName))
        .check(allowedName(resourceName))
        .check(distinct(resourceName, itemName))
        .add("itemName", itemName)
        .add("resourceName", resourceName)
        .add("resourceFileCRCCheckingEnabled", kNoCrcCheck)
        .upload(sourcePath, listener);
}

IZELServerStatus* ZELServerRepository::addItemResource(const IZELServerString& itemName,
                                                       const IZELServerString& resourceName,
                                                       const IZELServerString& sourcePath,
                                                       IZELServerProgressListener* listener)
{
    return guarded(
        [&] { return sendItemResource("REP_ADD_ITEMRESOURCE", itemName, resourceName, sourcePath, listener); });
}

IZELServerStatus* ZELServerRepository::addItemResource(const IZELServerString& itemName,
                                                       const IZELServerString& resourceName,
                                                       const IZELServerString& sourcePath)
{
    return addItemResource(itemName, resourceName, sourcePath, nullptr);
}

IZELServerStatus* ZELServerRepository::updateItemResource(const IZELServerString& itemName,
                                                          const IZELServerString& resourceName,
                                                          const IZELServerString& sourcePath,
                                                          IZELServerProgressListener* listener)
{
    return guarded(
        [&] { return sendItemResource("REP_UPDATE_ITEMRESOURCE", itemName, resourceName, sourcePath, listener); });
}

IZELServerStatus* ZELServerRepository::updateItemResource(const IZELServerString& itemName,
                                                          const IZELServerString& resourceName,
                                                          const IZELServerString& sourcePath)
{
    return updateItemResource(itemName, resourceName, sourcePath, nullptr);
}

IZELServerStatus* ZELServerRepository::removeItemResource(const IZELServerString& itemName,
                                                          const IZELServerString& resourceName, unsigned& removed)
{
    return guarded([&] { return askItemResource("REP_REMOVE_ITEMRESOURCE", itemName, resourceName, removed); });
}

// ---- Views ------------------------------------------------------------------------------------------

IZELServerStatus*
ZELServerRepository::getWorkspaceSummariesView(const ZELServerStringDict* directives,
                                               IZELServerVector<IZELServerWorkspaceSummary>& summaries)
{
    return guarded([&]() -> IZELServerStatus* {
        const ZELServerStringArray filter = enableFilterList(directives);
        return on("REP_GET_WORKSPACESUMMARIESVIEW")
            .require(filter.entries() >= 2)
            .addList("directives", filter)
            .askList([&](const IZELServerResponse& response) {
                return readWorkspaceSummariesReply(bodyOf(response), summaries);
            });
    });
}

IZELServerStatus* ZELServerRepository::getWorkspacesView(const ZELServerStringDict* directives,
                                                         IZELServerVector<IZELServerWorkspace>& workspaces)
{
    return guarded([&]() -> IZELServerStatus* {
        const ZELServerStringArray filter = enableFilterList(directives);
        return on("REP_GET_WORKSPACESVIEW")
            .require(filter.entries() >= 2)
            .addList("directives", filter)
            .askList([&](const IZELServerResponse& response) { return response.readWorkspaces(workspaces); });
    });
}

IZELServerStatus* ZELServerRepository::getWorkspaceView(const IZELServerString& workspaceName,
                                                        IZELServerWorkspace& workspace, unsigned& found)
{
    return guarded([&]() -> IZELServerStatus* {
        return on("REP_GET_WORKSPACEVIEW")
            .require(workspaceName)
            .add("workspaceName", workspaceName)
            .askObject(found, [&](const IZELServerResponse& response) { return response.readWorkspace(workspace); });
    });
}

// The directives of this view and the three below are not read: the server lists everything.
IZELServerStatus* ZELServerRepository::getCustomFormatsView(const ZELServerStringDict* /*directives*/,
                                                            IZELServerVector<IZELServerCustomFormat>& customFormats)
{
    return guarded([&]() -> IZELServerStatus* {
        return on("REP_GET_CUSTOMFORMATSVIEW")
            .addList("directives", allObjects())
            .askList([&](const IZELServerResponse& response) { return response.readCustomFormats(customFormats); });
    });
}

IZELServerStatus* ZELServerRepository::getCustomFormatView(const IZELServerString& customFormatName,
                                                           IZELServerCustomFormat& customFormat, unsigned& found)
{
    return guarded([&]() -> IZELServerStatus* {
        return on("REP_GET_CUSTOMFORMATVIEW")
            .require(customFormatName)
            .add("customFormatName", customFormatName)
            .askObject(found,
                       [&](const IZELServerResponse& response) { return response.readCustomFormat(customFormat); });
    });
}

IZELServerStatus*
ZELServerRepository::getCustomTransformersView(const ZELServerStringDict* /*directives*/,
                                               IZELServerVector<IZELServerCustomTransformer>& customTransformers)
{
    return guarded([&]() -> IZELServerStatus* {
        return on("REP_GET_CUSTOMTRANSFORMERSVIEW")
            .addList("directives", allObjects())
            .askList([&](const IZELServerResponse& response) {
                return response.readCustomTransformers(customTransformers);
            });
    });
}

IZELServerStatus* ZELServerRepository::getCustomTransformerView(const IZELServerString& customTransformerName,
                                                                IZELServerCustomTransformer& customTransformer,
                                                                unsigned& found)
{
    return guarded([&]() -> IZELServerStatus* {
        return on("REP_GET_CUSTOMTRANSFORMERVIEW")
            .require(customTransformerName)
            .add("customTransformerName", customTransformerName)
            .askObject(found, [&](const IZELServerResponse& response) {
                return response.readCustomTransformer(customTransformer);
            });
    });
}

// Nothing is checked here, not even the item name, which goes to the server as given.
IZELServerStatus* ZELServerRepository::getItemResourcesView(const IZELServerString& itemName,
                                                            const ZELServerStringDict* /*directives*/,
                                                            IZELServerVector<IZELServerResource>& resources)
{
    return guarded([&]() -> IZELServerStatus* {
        return on("REP_GET_ITEMRESOURCESVIEW")
            .add("itemName", itemName)
            .addList("directives", allObjects())
            .askList([&](const IZELServerResponse& response) { return response.readResources(resources); });
    });
}

IZELServerStatus* ZELServerRepository::getTemplatesView(const ZELServerStringDict* /*directives*/,
                                                        IZELServerVector<IZELServerTemplate>& templates)
{
    return guarded([&]() -> IZELServerStatus* {
        return on("REP_GET_TEMPLATESVIEW")
            .addList("directives", allObjects())
            .askList([&](const IZELServerResponse& response) { return response.readTemplates(templates); });
    });
}

IZELServerStatus* ZELServerRepository::getTemplateView(const IZELServerString& templateName, IZELServerTemplate& templ,
                                                       unsigned& found)
{
    return guarded([&]() -> IZELServerStatus* {
        return on("REP_GET_TEMPLATEVIEW")
            .require(templateName)
            .add("templateName", templateName)
            .askObject(found, [&](const IZELServerResponse& response) { return response.readTemplate(templ); });
    });
}

// ---- Workspace registrations ------------------------------------------------------------------------

IZELServerStatus*
ZELServerRepository::getWorkspaceServices(const ZELServerStringDict* directives,
                                          IZELServerVector<IZELServerWorkspaceService>& workspaceServices)
{
    return guarded([&]() -> IZELServerStatus* {
        const std::optional<ZELServerStringArray> filter = registrationFilterOf(directives);
        IZELServerChannel* channel = channel_;
        return on("REP_GET_WORKSPACESERVICES")
            .require(filter.has_value())
            .addList("directives", filter.value_or(ZELServerStringArray()))
            .askList([&](const IZELServerResponse& response) {
                return readWorkspaceServicesReply(bodyOf(response), channel, workspaceServices);
            });
    });
}

IZELServerStatus* ZELServerRepository::workspaceServiceExists(const IZELServerString& workspaceName,
                                                              const IZELServerString& serviceName, unsigned& exists)
{
    return guarded([&] {
        return on("REP_WORKSPACESERVICEEXISTS")
            .require(workspaceName)
            .require(serviceName)
            .add("workspaceName", workspaceName)
            .add("serviceName", serviceName)
            .askFlag(exists);
    });
}

IZELServerStatus* ZELServerRepository::registerWorkspaceService(const IZELServerString& workspaceName,
                                                                const IZELServerString& serviceName)
{
    return guarded([&] {
        return on("REP_REGISTER_WORKSPACESERVICE")
            .require(workspaceName)
            .require(serviceName)
            .add("workspaceName", workspaceName)
            .add("serviceName", serviceName)
            .send();
    });
}

IZELServerStatus* ZELServerRepository::deregisterWorkspaceService(const IZELServerString& workspaceName,
                                                                  const IZELServerString& serviceName,
                                                                  unsigned& deregistered)
{
    return guarded([&] {
        return on("REP_DEREGISTER_WORKSPACESERVICE")
            .require(workspaceName)
            .require(serviceName)
            .add("workspaceName", workspaceName)
            .add("serviceName", serviceName)
            .askFlag(deregistered);
    });
}

}  // namespace zel
