#pragma once
// The session a client gets from ZEL_createServerSession: one channel to the server, the four
// managers bound to it, and the factory for every object that crosses the interface.

#include <memory>

#include <zelserverapi/interfaces.h>

#include "api/heap.h"
#include "transport/xml_platform.h"

namespace zel {

class IZELServerChannel;

class ZELServerSession final : public IZELServerSession, public HeapObject {
public:
    ZELServerSession();
    ~ZELServerSession() override;

    IZELServerStatus* init(const IZELServerConnectionInfo& info,
                           const IZELServerStringArray* handshakeOptions) override;

    IZELServerConnectionInfo* createConnectionInfo(const IZELServerString& address,
                                                   const IZELServerStringArray& properties) override;
    IZELServerConnectionInfo* createConnectionInfo(const IZELServerString& address, const IZELServerString& userName,
                                                   const IZELServerString& password) override;
    IZELServerConnectionInfo* createConnectionInfo(const IZELServerString& host, unsigned short port,
                                                   const IZELServerStringArray& properties) override;
    IZELServerConnectionInfo* createConnectionInfo(const IZELServerString& host, unsigned short port,
                                                   const IZELServerString& userName,
                                                   const IZELServerString& password) override;
    void destroyConnectionInfo(IZELServerConnectionInfo** info) override;

    IZELServerStatus* disconnect() override;
    IZELServerTransformationManager* getTransformationManager() override;
    IZELServerRepositoryManager* getRepositoryManager() override;

    IZELServerString* createString() override;
    void destroyString(IZELServerString** string) override;
    IZELServerStringArray* createStringArray() override;
    void destroyStringArray(IZELServerStringArray** array) override;

    IZELServerTransformationRequest* createTransformationRequest(const IZELServerString& keyword,
                                                                 const IZELServerString& repository,
                                                                 const IZELServerWorkspace& workspace) override;
    IZELServerTransformationRequest* createTransformationRequest(const IZELServerString& keyword,
                                                                 const IZELServerString& repository,
                                                                 const IZELServerString& workspace) override;
    IZELServerTransformationRequest* createTransformationRequest(const IZELServerString& keyword,
                                                                 const IZELServerString& workspacePath) override;
    void destroyTransformationRequest(IZELServerTransformationRequest** request) override;

    IZELServerTransformationResult* createTransformationResult(const IZELServerString& resultText) override;
    IZELServerTransformationResult* createTransformationResult() override;
    void destroyTransformationResult(IZELServerTransformationResult** result) override;

    IZELServerService* createService(const IZELServerString& name, const IZELServerString& displayName,
                                     const IZELServerString& description, const IZELServerString& urlPattern) override;
    IZELServerService* createService() override;
    void destroyService(IZELServerService** service) override;
    IZELServerVector<IZELServerService>* createServiceVector() override;
    void destroyServiceVector(IZELServerVector<IZELServerService>** vector) override;

    IZELServerWorkspace* createWorkspace() override;
    void destroyWorkspace(IZELServerWorkspace** workspace) override;
    IZELServerVector<IZELServerWorkspace>* createWorkspaceVector() override;
    void destroyWorkspaceVector(IZELServerVector<IZELServerWorkspace>** vector) override;

    IZELServerRepository* createRepository() override;
    void destroyRepository(IZELServerRepository** repository) override;
    IZELServerVector<IZELServerRepository>* createRepositoryVector() override;
    void destroyRepositoryVector(IZELServerVector<IZELServerRepository>** vector) override;

    IZELServerWorkspaceSummary* createWorkspaceSummary() override;
    void destroyWorkspaceSummary(IZELServerWorkspaceSummary** summary) override;
    IZELServerVector<IZELServerWorkspaceSummary>* createWorkspaceSummaryVector() override;
    void destroyWorkspaceSummaryVector(IZELServerVector<IZELServerWorkspaceSummary>** vector) override;

    IZELServerWorkspaceService* createWorkspaceService() override;
    void destroyWorkspaceService(IZELServerWorkspaceService** workspaceService) override;
    IZELServerVector<IZELServerWorkspaceService>* createWorkspaceServiceVector() override;
    void destroyWorkspaceServiceVector(IZELServerVector<IZELServerWorkspaceService>** vector) override;

    void destroyStatus(IZELServerStatus** status) override;

    IZELServerCustomFormat* createCustomFormat() override;
    void destroyCustomFormat(IZELServerCustomFormat** customFormat) override;
    IZELServerVector<IZELServerCustomFormat>* createCustomFormatVector() override;
    void destroyCustomFormatVector(IZELServerVector<IZELServerCustomFormat>** vector) override;

    IZELServerCustomTransformer* createCustomTransformer() override;
    void destroyCustomTransformer(IZELServerCustomTransformer** customTransformer) override;
    IZELServerVector<IZELServerCustomTransformer>* createCustomTransformerVector() override;
    void destroyCustomTransformerVector(IZELServerVector<IZELServerCustomTransformer>** vector) override;

    IZELServerResource* createResource() override;
    void destroyResource(IZELServerResource** resource) override;
    IZELServerVector<IZELServerResource>* createResourceVector() override;
    void destroyResourceVector(IZELServerVector<IZELServerResource>** vector) override;

    IZELServerPropertyAccessor* createPropertyAccessor() override;
    void destroyPropertyAccessor(IZELServerPropertyAccessor** accessor) override;
    IZELServerVector<IZELServerProperty>* createPropertyVector() override;
    void destroyPropertyVector(IZELServerVector<IZELServerProperty>** vector) override;

    IZELServerLogFileInfo* createLogFileInfo() override;
    void destroyLogFileInfo(IZELServerLogFileInfo** info) override;

    IZELServerStatus* getSessionProperty(const IZELServerString& name, IZELServerString& value) override;

    IZELServerTemplate* createTemplate() override;
    void destroyTemplate(IZELServerTemplate** templ) override;
    IZELServerVector<IZELServerTemplate>* createTemplateVector() override;
    void destroyTemplateVector(IZELServerVector<IZELServerTemplate>** vector) override;

    IZELServerVector<IZELServerItem>* createItemVector() override;
    void destroyItemVector(IZELServerVector<IZELServerItem>** vector) override;

    IZELServerIdentity* getIdentity() override;
    IZELServerSecurityManager* getSecurityManager() override;
    IZELServerMountPointManager* getMountPointManager() override;

    IZELServerMountPoint* createMountPoint() override;
    void destroyMountPoint(IZELServerMountPoint** mountPoint) override;
    IZELServerVector<IZELServerMountPoint>* createMountPointVector() override;
    void destroyMountPointVector(IZELServerVector<IZELServerMountPoint>** vector) override;

    IZELServerFileInfo* createFileInfo() override;
    void destroyFileInfo(IZELServerFileInfo** info) override;
    IZELServerVector<IZELServerFileInfo>* createFileInfoVector() override;
    void destroyFileInfoVector(IZELServerVector<IZELServerFileInfo>** vector) override;

private:
    IZELServerStatus* connect(const IZELServerConnectionInfo& info, const IZELServerStringArray* handshakeOptions);
    void teardown();
    void makeManagers();

    std::unique_ptr<IZELServerTransformationManager> transformationManager_;
    std::unique_ptr<IZELServerRepositoryManager> repositoryManager_;
    std::unique_ptr<IZELServerSecurityManager> securityManager_;
    std::unique_ptr<IZELServerMountPointManager> mountPointManager_;
    std::unique_ptr<IZELServerChannel> channel_;
    unsigned connectionKind_ = 0;
    // Keeps the XML platform up for the session's whole life, so that a run of commands does not
    // start and stop the XML library once per document.
    XmlPlatformRef xmlPlatform_;
};

}  // namespace zel
