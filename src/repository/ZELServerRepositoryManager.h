#pragma once
// The session's entry to repositories and services (see IZELServerRepositoryManager). Holds the
// session's channel without owning it and keeps nothing else: every call goes to the server.

#include <zelserverapi/IZELServerRepositoryManager.h>

#include "api/heap.h"
#include "transport/IZELServerChannel.h"

namespace zel {

class ZELServerRepositoryManager final : public IZELServerRepositoryManager, public HeapObject {
public:
    // `channel` is borrowed (null: the commands fail with 393622 once their arguments pass).
    explicit ZELServerRepositoryManager(IZELServerChannel* channel) : channel_(channel) {}
    ZELServerRepositoryManager(const ZELServerRepositoryManager&) = delete;
    ZELServerRepositoryManager& operator=(const ZELServerRepositoryManager&) = delete;
    ~ZELServerRepositoryManager() override = default;

    IZELServerStatus* serviceExists(const IZELServerString& serviceName, unsigned& exists) override;
    IZELServerStatus* getServices(const ZELServerStringDict* directives,
                                  IZELServerVector<IZELServerService>& services) override;
    IZELServerStatus* getService(const IZELServerString& serviceName, IZELServerService& service,
                                 unsigned& found) override;
    IZELServerStatus* addService(const IZELServerService& service) override;
    IZELServerStatus* updateService(const IZELServerService& service) override;
    IZELServerStatus* removeService(const IZELServerString& serviceName, unsigned& removed) override;

    IZELServerStatus* repositoryExists(const IZELServerString& repositoryName, unsigned& exists) override;
    IZELServerStatus* getRepositories(const ZELServerStringDict* directives,
                                      IZELServerVector<IZELServerRepository>& repositories) override;
    IZELServerStatus* getRepository(const IZELServerString& repositoryName, IZELServerRepository& repository,
                                    unsigned& found) override;
    IZELServerStatus* addRepository(const IZELServerString& repositoryName,
                                    const IZELServerString& description) override;
    IZELServerStatus* removeRepository(const IZELServerString& repositoryName, unsigned& removed) override;

    IZELServerStatus* getGlobalItems(const ZELServerStringDict* directives, IZELServerPropertyAccessor& items) override;

private:
    IZELServerChannel* channel_;
};

}  // namespace zel
