#pragma once
// A path inside a shared resource ("PATH"): the last component, the directory that holds it, and the
// whole path. Made by IZELServerMountPoint::createPath and destroyed by
// IZELServerMountPoint::releaseObject, or held inside an IZELServerFileInfo.

#include "IZELServerString.h"

class IZELServerPath {
public:
    virtual void getName(IZELServerString& out) const = 0;
    virtual void getDirectoryPath(IZELServerString& out) const = 0;
    virtual void getAbsolutePath(IZELServerString& out) const = 0;
    virtual ~IZELServerPath() = default;

protected:
    IZELServerPath() = default;
    IZELServerPath(const IZELServerPath&) = default;
    IZELServerPath& operator=(const IZELServerPath&) = default;
};
