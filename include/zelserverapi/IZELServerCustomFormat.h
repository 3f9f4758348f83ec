#pragma once
// A custom format stored in a repository ("CUSTOMFORMAT"), as described by the repository's custom
// format views. Made by IZELServerSession::createCustomFormat (or by a list, whose vector owns it) and
// destroyed by the matching session operation. Read-only; missing attributes read as empty text or 0.
// Custom formats, custom transformers and templates share one layout.

#include "IZELServerString.h"

class IZELServerCustomFormat {
public:
    virtual void getName(IZELServerString& out) const = 0;
    virtual void getDescription(IZELServerString& out) const = 0;
    // Size in bytes as the server reported it.
    virtual long long getFileSize() const = 0;
    virtual void getTitle(IZELServerString& out) const = 0;
    // Always 2, the item type of custom formats (see IZELServerItem).
    virtual unsigned getItemType() const = 0;
    virtual ~IZELServerCustomFormat() = default;

protected:
    IZELServerCustomFormat() = default;
    IZELServerCustomFormat(const IZELServerCustomFormat&) = default;
    IZELServerCustomFormat& operator=(const IZELServerCustomFormat&) = default;
};
