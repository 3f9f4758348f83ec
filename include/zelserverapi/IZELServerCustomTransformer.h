#pragma once
// A custom transformer stored in a repository ("CUSTOMTRANSFORMER"), as described by the repository's
// custom transformer views. Made by IZELServerSession::createCustomTransformer (or by a list, whose
// vector owns it) and destroyed by the matching session operation. Read-only; missing attributes read
// as empty text or 0. Custom formats, custom transformers and templates share one layout.

#include "IZELServerString.h"

class IZELServerCustomTransformer {
public:
    virtual void getName(IZELServerString& out) const = 0;
    virtual void getDescription(IZELServerString& out) const = 0;
    // Size in bytes as the server reported it.
    virtual long long getFileSize() const = 0;
    // Always empty: the server describes custom transformers without a title. The slot keeps the
    // layout equal to that of custom formats and templates.
    virtual void getTitle(IZELServerString& out) const = 0;
    // Always 3, the item type of custom transformers (see IZELServerItem).
    virtual unsigned getItemType() const = 0;
    virtual ~IZELServerCustomTransformer() = default;

protected:
    IZELServerCustomTransformer() = default;
    IZELServerCustomTransformer(const IZELServerCustomTransformer&) = default;
    IZELServerCustomTransformer& operator=(const IZELServerCustomTransformer&) = default;
};
