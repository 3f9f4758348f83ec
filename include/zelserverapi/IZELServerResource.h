#pragma once
// A resource file attached to a repository item ("RESOURCE"), as described by the repository's
// resource views or held by a workspace. Made by IZELServerSession::createResource (or by a list,
// whose vector owns it) and destroyed by the matching session operation. Read-only; missing
// attributes read as empty text or 0.

#include "IZELServerString.h"

class IZELServerResource {
public:
    virtual void getName(IZELServerString& out) const = 0;
    virtual void getDescription(IZELServerString& out) const = 0;
    // Size in bytes as the server reported it.
    virtual int getFileSize() const = 0;
    virtual ~IZELServerResource() = default;

protected:
    IZELServerResource() = default;
    IZELServerResource(const IZELServerResource&) = default;
    IZELServerResource& operator=(const IZELServerResource&) = default;
};
