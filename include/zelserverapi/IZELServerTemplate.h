#pragma once
// A template stored in a repository ("TEMPLATE"), as described by the repository's template views.
// Made by IZELServerSession::createTemplate (or by a list, whose vector owns it) and destroyed by the
// matching session operation. Read-only; missing attributes read as empty text or 0. Custom formats,
// custom transformers and templates share one layout.

#include "IZELServerString.h"

class IZELServerTemplate {
public:
    virtual void getName(IZELServerString& out) const = 0;
    virtual void getDescription(IZELServerString& out) const = 0;
    // Size in bytes as the server reported it.
    virtual long long getFileSize() const = 0;
    virtual void getTitle(IZELServerString& out) const = 0;
    // Always 4, the item type of templates (see IZELServerItem).
    virtual unsigned getItemType() const = 0;
    virtual ~IZELServerTemplate() = default;

protected:
    IZELServerTemplate() = default;
    IZELServerTemplate(const IZELServerTemplate&) = default;
    IZELServerTemplate& operator=(const IZELServerTemplate&) = default;
};
