#pragma once
// One registration of a workspace with a service ("WORKSPACE_SERVICE"), as listed by
// IZELServerRepository::getWorkspaceServices. Made by IZELServerSession::createWorkspaceService (or by
// a list, whose vector owns it) and destroyed by the matching session operation. It owns the summary
// and the service it hands out: never destroy them yourself.

#include "IZELServerService.h"
#include "IZELServerWorkspaceSummary.h"

class IZELServerWorkspaceService {
public:
    virtual const IZELServerWorkspaceSummary& getWorkspaceSummary() const = 0;
    // The service, able to talk to the server like any other.
    virtual IZELServerService& getService() = 0;
    virtual ~IZELServerWorkspaceService() = default;

protected:
    IZELServerWorkspaceService() = default;
    IZELServerWorkspaceService(const IZELServerWorkspaceService&) = default;
    IZELServerWorkspaceService& operator=(const IZELServerWorkspaceService&) = default;
};
