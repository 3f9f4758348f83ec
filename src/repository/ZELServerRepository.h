#pragma once
// One repository on the server ("REPOSITORY": "name", "description") and every command that works
// inside it. Each command's first value is "repositoryName" = this repository's name.

#include <string>

#include <zelserverapi/IZELServerRepository.h>

#include "api/heap.h"
#include "repository/repository_checks.h"
#include "transport/IZELServerChannel.h"
#include "transport/xml_document.h"

namespace zel {

struct RepositoryFields {
    std::string name;
    std::string description;
};

class ZELServerRepository final : public IZELServerRepository, public HeapObject {
public:
    // `channel` is borrowed (null: the commands fail with 393622 once their arguments pass).
    explicit ZELServerRepository(IZELServerChannel* channel) : channel_(channel) {}
    ZELServerRepository(IZELServerChannel* channel, const IZELServerString& name, const IZELServerString& description);
    ZELServerRepository(const ZELServerRepository&) = delete;
    ZELServerRepository& operator=(const ZELServerRepository&) = delete;
    ~ZELServerRepository() override = default;

    void getName(IZELServerString& out) const override;
    void getDescription(IZELServerString& out) const override;

    IZELServerStatus* itemExists(const IZELServerString& itemName, unsigned& exists) override;
    IZELServerStatus* getItem(const IZELServerString& itemName, const IZELServerString& destinationPath,
                              unsigned& received, IZELServerProgressListener* listener) override;
    IZELServerStatus* getItem(const IZELServerString& itemName, const IZELServerString& destinationPath,
                              unsigned& received) override;
    IZELServerStatus* addItem(const IZELServerString& itemName, const IZELServerString& sourcePath,
                              IZELServerProgressListener* listener) override;
    IZELServerStatus* addItem(const IZELServerString& itemName, const IZELServerString& sourcePath) override;
    IZELServerStatus* updateItem(const IZELServerString& itemName, const IZELServerString& sourcePath,
                                 IZELServerProgressListener* listener) override;
    IZELServerStatus* updateItem(const IZELServerString& itemName, const IZELServerString& sourcePath) override;
    IZELServerStatus* removeItem(const IZELServerString& itemName, unsigned& removed) override;

    IZELServerStatus* itemResourceExists(const IZELServerString& itemName, const IZELServerString& resourceName,
                                         unsigned& exists) override;
    IZELServerStatus* getItemResource(const IZELServerString& itemName, const IZELServerString& resourceName,
                                      const IZELServerString& destinationPath, unsigned& received,
                                      IZELServerProgressListener* listener) override;
    IZELServerStatus* getItemResourceView(const IZELServerString& itemName, const IZELServerString& resourceName,
                                          IZELServerResource& resource, unsigned& found) override;
    IZELServerStatus* getItemResource(const IZELServerString& itemName, const IZELServerString& resourceName,
                                      const IZELServerString& destinationPath, unsigned& received) override;
    IZELServerStatus* addItemResource(const IZELServerString& itemName, const IZELServerString& resourceName,
                                      const IZELServerString& sourcePath,
                                      IZELServerProgressListener* listener) override;
    IZELServerStatus* addItemResource(const IZELServerString& itemName, const IZELServerString& resourceName,
                                      const IZELServerString& sourcePath) override;
    IZELServerStatus* updateItemResource(const IZELServerString& itemName, const IZELServerString& resourceName,
                                         const IZELServerString& sourcePath,
                                         IZELServerProgressListener* listener) override;
    IZELServerStatus* updateItemResource(const IZELServerString& itemName, const IZELServerString& resourceName,
                                         const IZELServerString& sourcePath) override;
    IZELServerStatus* removeItemResource(const IZELServerString& itemName, const IZELServerString& resourceName,
                                         unsigned& removed) override;

    IZELServerStatus* getWorkspaceSummariesView(const ZELServerStringDict* directives,
                                                IZELServerVector<IZELServerWorkspaceSummary>& summaries) override;
    IZELServerStatus* getWorkspacesView(const ZELServerStringDict* directives,
                                        IZELServerVector<IZELServerWorkspace>& workspaces) override;
    IZELServerStatus* getWorkspaceView(const IZELServerString& workspaceName, IZELServerWorkspace& workspace,
                                       unsigned& found) override;
    IZELServerStatus* getCustomFormatsView(const ZELServerStringDict* directives,
                                           IZELServerVector<IZELServerCustomFormat>& customFormats) override;
    IZELServerStatus* getCustomFormatView(const IZELServerString& customFormatName,
                                          IZELServerCustomFormat& customFormat, unsigned& found) override;
    IZELServerStatus*
    getCustomTransformersView(const ZELServerStringDict* directives,
                              IZELServerVector<IZELServerCustomTransformer>& customTransformers) override;
    IZELServerStatus* getCustomTransformerView(const IZELServerString& customTransformerName,
                                               IZELServerCustomTransformer& customTransformer,
                                               unsigned& found) override;
    IZELServerStatus* getItemResourcesView(const IZELServerString& itemName, const ZELServerStringDict* directives,
                                           IZELServerVector<IZELServerResource>& resources) override;

    IZELServerStatus* getWorkspaceServices(const ZELServerStringDict* directives,
                                           IZELServerVector<IZELServerWorkspaceService>& workspaceServices) override;
    IZELServerStatus* workspaceServiceExists(const IZELServerString& workspaceName, const IZELServerString& serviceName,
                                             unsigned& exists) override;
    IZELServerStatus* registerWorkspaceService(const IZELServerString& workspaceName,
                                               const IZELServerString& serviceName) override;
    IZELServerStatus* deregisterWorkspaceService(const IZELServerString& workspaceName,
                                                 const IZELServerString& serviceName, unsigned& deregistered) override;

    IZELServerStatus* getTemplatesView(const ZELServerStringDict* directives,
                                       IZELServerVector<IZELServerTemplate>& templates) override;
    IZELServerStatus* getTemplateView(const IZELServerString& templateName, IZELServerTemplate& templ,
                                      unsigned& found) override;

    // Binds the repository to the channel of the reply it is read from.
    void bindTo(IZELServerChannel* channel) { channel_ = channel; }
    // Replaces name and description from a "REPOSITORY" element.
    bool readFrom(const XmlElement& element);

private:
    // A command of this repository: `keyword` with "repositoryName" as its first value.
    CheckedCommand on(const char* keyword, Where where = Where::current()) const;
    IZELServerStatus* askItemResource(const char* keyword, const IZELServerString& itemName,
                                      const IZELServerString& resourceName, unsigned& answer,
                                      Where where = Where::current());
    IZELServerStatus* sendItemResource(const char* keyword, const IZELServerString& itemName,
                                       const IZELServerString& resourceName, const IZELServerString& sourcePath,
                                       IZELServerProgressListener* listener, Where where = Where::current());

    IZELServerChannel* channel_;
    RepositoryFields fields_;
};

}  // namespace zel
