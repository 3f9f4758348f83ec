#pragma once
// The description of one file or directory in a shared resource ("FILEINFO"). Made by
// IZELServerSession::createFileInfo (or by a list, whose vector owns it) and destroyed by the matching
// session operation. Read-only.

#include "IZELServerPath.h"
#include "IZELServerString.h"

class IZELServerFileInfo {
public:
    // The entry's path, held inside this object: it lives as long as the file info.
    virtual const IZELServerPath& getPath() const = 0;
    // True exactly when the server's file type is "DIR" (case matters).
    virtual bool isDirectory() const = 0;
    // Size in bytes as the server reported it.
    virtual unsigned getSize() const = 0;
    // The date as the server wrote it, not interpreted.
    virtual void getDate(IZELServerString& out) const = 0;
    virtual ~IZELServerFileInfo() = default;

protected:
    IZELServerFileInfo() = default;
    IZELServerFileInfo(const IZELServerFileInfo&) = default;
    IZELServerFileInfo& operator=(const IZELServerFileInfo&) = default;
};
