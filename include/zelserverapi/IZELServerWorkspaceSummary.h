#pragma once
// A short description of one workspace in a repository ("WORKSPACE_SUMMARY"), as listed by
// IZELServerRepository::getWorkspaceSummariesView. Made by IZELServerSession::createWorkspaceSummary
// (or by the list, whose vector owns it) and destroyed by the matching session operation.
// Read-only; missing attributes read as empty text or false.

#include "IZELServerString.h"

class IZELServerWorkspaceSummary {
public:
    virtual void getName(IZELServerString& out) const = 0;
    virtual void getTitle(IZELServerString& out) const = 0;
    virtual void getDescription(IZELServerString& out) const = 0;
    virtual bool isEnabled() const = 0;
    virtual ~IZELServerWorkspaceSummary() = default;

protected:
    IZELServerWorkspaceSummary() = default;
    IZELServerWorkspaceSummary(const IZELServerWorkspaceSummary&) = default;
    IZELServerWorkspaceSummary& operator=(const IZELServerWorkspaceSummary&) = default;
};
