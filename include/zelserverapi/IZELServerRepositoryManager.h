#pragma once
// The entry to the server's repositories and services: list, fetch, add and remove repositories; list,
// fetch, add, update and remove services; and the one global query for all items. Owned by the session
// (IZELServerSession::getRepositoryManager); never destroy it yourself. Repositories and services it
// fills can talk to the server themselves, through the same connection.
//
// Every operation is one exchange with the server, with no cache, and returns null on success or a
// status that the caller destroys with IZELServerSession::destroyStatus. Checked before anything is
// sent: 393619 for an empty name or unusable directives; 393626 for a repository name holding one of
// \ / : * ? " < > | & = ' + % (getRepository, addRepository, removeRepository only). The connection's
// statuses come back unchanged. Out flags are set to 0 first and then to the server's answer, so they
// read 0 after any failure. Lists fill the caller's vector after clearing it.

#include "IZELServerPropertyAccessor.h"
#include "IZELServerRepository.h"
#include "IZELServerService.h"
#include "IZELServerStatus.h"
#include "IZELServerString.h"
#include "IZELServerVector.h"
#include "ZELServerStringDict.h"

class IZELServerRepositoryManager {
public:
    virtual IZELServerStatus* serviceExists(const IZELServerString& serviceName, unsigned& exists) = 0;
    // Null directives list all services; otherwise "ENABLE_FILTER" must be "ALL", "ENABLED" or
    // "DISABLED" (exact), else 393619.
    virtual IZELServerStatus* getServices(const ZELServerStringDict* directives,
                                          IZELServerVector<IZELServerService>& services) = 0;
    // `found` is 1 when the server described the service.
    virtual IZELServerStatus* getService(const IZELServerString& serviceName, IZELServerService& service,
                                         unsigned& found) = 0;
    virtual IZELServerStatus* addService(const IZELServerService& service) = 0;
    // Sends the service's settings as an update of that service on the server.
    virtual IZELServerStatus* updateService(const IZELServerService& service) = 0;
    virtual IZELServerStatus* removeService(const IZELServerString& serviceName, unsigned& removed) = 0;

    // Checks only that the name is not empty.
    virtual IZELServerStatus* repositoryExists(const IZELServerString& repositoryName, unsigned& exists) = 0;
    // Lists every repository. `directives` must be null (393619 otherwise).
    virtual IZELServerStatus* getRepositories(const ZELServerStringDict* directives,
                                              IZELServerVector<IZELServerRepository>& repositories) = 0;
    // `found` is 1 when the server described the repository.
    virtual IZELServerStatus* getRepository(const IZELServerString& repositoryName, IZELServerRepository& repository,
                                            unsigned& found) = 0;
    virtual IZELServerStatus* addRepository(const IZELServerString& repositoryName,
                                            const IZELServerString& description) = 0;
    virtual IZELServerStatus* removeRepository(const IZELServerString& repositoryName, unsigned& removed) = 0;

    // Runs the global query that `directives` selects and fills `items` from the answer. Only "GLOBAL"
    // = "ALLITEMS" (exact) selects a query; null or other directives return null and do nothing. 393621
    // when the answer holds no document, or the XML parser's status when it does not parse.
    virtual IZELServerStatus* getGlobalItems(const ZELServerStringDict* directives,
                                             IZELServerPropertyAccessor& items) = 0;

    virtual ~IZELServerRepositoryManager() = default;

protected:
    IZELServerRepositoryManager() = default;
    IZELServerRepositoryManager(const IZELServerRepositoryManager&) = delete;
    IZELServerRepositoryManager& operator=(const IZELServerRepositoryManager&) = delete;
};
