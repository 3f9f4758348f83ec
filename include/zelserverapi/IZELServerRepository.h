#pragma once
// One named repository on the server, and the way to work inside it: items (workspace files and the
// like) and the resources attached to them, the views that describe what the repository holds, and
// the registration of workspaces with services. Made by IZELServerSession::createRepository or filled
// by IZELServerRepositoryManager::getRepository (or by a list, whose vector owns it) and destroyed by
// the matching session operation. Operations that talk to the server need a session that is still
// connected as it was when the repository was made.
//
// Every operation but the two getters returns null on success or a status that the caller destroys
// with IZELServerSession::destroyStatus. Checked before anything is sent:
//   393619  an empty name or path (getItemResourceView checks only the item name;
//           getItemResourcesView checks nothing);
//   393626  a forbidden character (one of \ / : * ? " < > | & = ' + %) in the item name of itemExists,
//           getItem, addItem and removeItem, or in the item or resource name of the item resource
//           operations; updateItem, the views and the workspace registrations do not check;
//   393627  a resource named like its item (addItemResource, updateItemResource);
//   393623  a local file to upload that cannot be opened (the path);
//   393624  a local file to download into that cannot be opened (the path).
//
// Every download (shared resource, item, item resource, job log) follows one rule: the file is
// received into a temporary file "wb-tmp-XXXXXX.tmp" in the destination's folder, which replaces the
// destination only after a complete exchange whose final answer is "true" (`received` then 1). A
// failed download never truncates, empties or deletes an existing destination: 393624 when the
// temporary file cannot be made (before anything is sent) or cannot replace the destination; the
// server's refusal as 393625 with its text; 393638 naming the source when the server sent no file;
// a final answer "false" gives success with `received` 0; any other answer 393604.
// The connection's statuses come back unchanged. Out flags are set to 0 first and then to the server's
// answer, so they read 0 after any failure. Found flags become 1 when the reply described the object.
//
// Transfers take a progress listener (owned by the caller, may be null; see
// IZELServerProgressListener); the short forms pass null. Local paths are file paths on this machine.
//
// Views fill the caller's vector after clearing it. Their directives may be null. Where a filter is
// read, the key "ENABLE_FILTER" selects "ALL", "ENABLED" or "DISABLED" objects (exact values); no
// directives means all.

#include "IZELServerCustomFormat.h"
#include "IZELServerCustomTransformer.h"
#include "IZELServerProgressListener.h"
#include "IZELServerResource.h"
#include "IZELServerStatus.h"
#include "IZELServerString.h"
#include "IZELServerTemplate.h"
#include "IZELServerVector.h"
#include "IZELServerWorkspace.h"
#include "IZELServerWorkspaceService.h"
#include "IZELServerWorkspaceSummary.h"
#include "ZELServerStringDict.h"

class IZELServerRepository {
public:
    virtual void getName(IZELServerString& out) const = 0;
    virtual void getDescription(IZELServerString& out) const = 0;

    virtual IZELServerStatus* itemExists(const IZELServerString& itemName, unsigned& exists) = 0;
    // Downloads the item into `destinationPath` by the download rule above; an item of zero bytes
    // counts as no file (393638 with the item name).
    virtual IZELServerStatus* getItem(const IZELServerString& itemName, const IZELServerString& destinationPath,
                                      unsigned& received, IZELServerProgressListener* listener) = 0;
    virtual IZELServerStatus* getItem(const IZELServerString& itemName, const IZELServerString& destinationPath,
                                      unsigned& received) = 0;
    // Uploads a new item from the local file `sourcePath`.
    virtual IZELServerStatus* addItem(const IZELServerString& itemName, const IZELServerString& sourcePath,
                                      IZELServerProgressListener* listener) = 0;
    virtual IZELServerStatus* addItem(const IZELServerString& itemName, const IZELServerString& sourcePath) = 0;
    // Replaces an item's contents from the local file `sourcePath`.
    virtual IZELServerStatus* updateItem(const IZELServerString& itemName, const IZELServerString& sourcePath,
                                         IZELServerProgressListener* listener) = 0;
    virtual IZELServerStatus* updateItem(const IZELServerString& itemName, const IZELServerString& sourcePath) = 0;
    virtual IZELServerStatus* removeItem(const IZELServerString& itemName, unsigned& removed) = 0;

    virtual IZELServerStatus* itemResourceExists(const IZELServerString& itemName, const IZELServerString& resourceName,
                                                 unsigned& exists) = 0;
    // Downloads the resource into `destinationPath` by the download rule above (393638 names the
    // resource).
    virtual IZELServerStatus* getItemResource(const IZELServerString& itemName, const IZELServerString& resourceName,
                                              const IZELServerString& destinationPath, unsigned& received,
                                              IZELServerProgressListener* listener) = 0;
    // Describes one resource of the item.
    virtual IZELServerStatus* getItemResourceView(const IZELServerString& itemName,
                                                  const IZELServerString& resourceName, IZELServerResource& resource,
                                                  unsigned& found) = 0;
    virtual IZELServerStatus* getItemResource(const IZELServerString& itemName, const IZELServerString& resourceName,
                                              const IZELServerString& destinationPath, unsigned& received) = 0;
    virtual IZELServerStatus* addItemResource(const IZELServerString& itemName, const IZELServerString& resourceName,
                                              const IZELServerString& sourcePath,
                                              IZELServerProgressListener* listener) = 0;
    virtual IZELServerStatus* addItemResource(const IZELServerString& itemName, const IZELServerString& resourceName,
                                              const IZELServerString& sourcePath) = 0;
    virtual IZELServerStatus* updateItemResource(const IZELServerString& itemName, const IZELServerString& resourceName,
                                                 const IZELServerString& sourcePath,
                                                 IZELServerProgressListener* listener) = 0;
    virtual IZELServerStatus* updateItemResource(const IZELServerString& itemName, const IZELServerString& resourceName,
                                                 const IZELServerString& sourcePath) = 0;
    virtual IZELServerStatus* removeItemResource(const IZELServerString& itemName, const IZELServerString& resourceName,
                                                 unsigned& removed) = 0;

    // Filtered by "ENABLE_FILTER"; directives without one of its three values give 393619.
    virtual IZELServerStatus* getWorkspaceSummariesView(const ZELServerStringDict* directives,
                                                        IZELServerVector<IZELServerWorkspaceSummary>& summaries) = 0;
    virtual IZELServerStatus* getWorkspacesView(const ZELServerStringDict* directives,
                                                IZELServerVector<IZELServerWorkspace>& workspaces) = 0;
    virtual IZELServerStatus* getWorkspaceView(const IZELServerString& workspaceName, IZELServerWorkspace& workspace,
                                               unsigned& found) = 0;
    // `directives` is not read: all custom formats are listed.
    virtual IZELServerStatus* getCustomFormatsView(const ZELServerStringDict* directives,
                                                   IZELServerVector<IZELServerCustomFormat>& customFormats) = 0;
    virtual IZELServerStatus* getCustomFormatView(const IZELServerString& customFormatName,
                                                  IZELServerCustomFormat& customFormat, unsigned& found) = 0;
    // `directives` is not read: all custom transformers are listed.
    virtual IZELServerStatus*
    getCustomTransformersView(const ZELServerStringDict* directives,
                              IZELServerVector<IZELServerCustomTransformer>& customTransformers) = 0;
    virtual IZELServerStatus* getCustomTransformerView(const IZELServerString& customTransformerName,
                                                       IZELServerCustomTransformer& customTransformer,
                                                       unsigned& found) = 0;
    // `directives` is not read: all resources of the item are listed.
    virtual IZELServerStatus* getItemResourcesView(const IZELServerString& itemName,
                                                   const ZELServerStringDict* directives,
                                                   IZELServerVector<IZELServerResource>& resources) = 0;

    // The registrations of workspaces with services. A missing "ENABLE_FILTER" means all, an unknown
    // value gives 393619; "WORKSPACE_NAME" limits the list to that workspace.
    virtual IZELServerStatus* getWorkspaceServices(const ZELServerStringDict* directives,
                                                   IZELServerVector<IZELServerWorkspaceService>& workspaceServices) = 0;
    virtual IZELServerStatus* workspaceServiceExists(const IZELServerString& workspaceName,
                                                     const IZELServerString& serviceName, unsigned& exists) = 0;
    virtual IZELServerStatus* registerWorkspaceService(const IZELServerString& workspaceName,
                                                       const IZELServerString& serviceName) = 0;
    virtual IZELServerStatus* deregisterWorkspaceService(const IZELServerString& workspaceName,
                                                         const IZELServerString& serviceName,
                                                         unsigned& deregistered) = 0;

    // `directives` is not read: all templates are listed.
    virtual IZELServerStatus* getTemplatesView(const ZELServerStringDict* directives,
                                               IZELServerVector<IZELServerTemplate>& templates) = 0;
    virtual IZELServerStatus* getTemplateView(const IZELServerString& templateName, IZELServerTemplate& templ,
                                              unsigned& found) = 0;

    virtual ~IZELServerRepository() = default;

protected:
    IZELServerRepository() = default;
    IZELServerRepository(const IZELServerRepository&) = default;
    IZELServerRepository& operator=(const IZELServerRepository&) = default;
};
