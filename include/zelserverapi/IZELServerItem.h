#pragma once
// One item stored in a repository ("ITEM"), as listed by IZELServerService::getRegisteredItems. Items
// come only in vectors (IZELServerSession::createItemVector), which own them. Read-only; missing
// attributes read as empty text or 0.
//
// Item types follow from the end of the name, compared case-sensitively: ".zlw" 1 (workspace),
// ".zds" 2 (custom format), ".zlx" 3 (custom transformer), ".zlwt" 4 (template), anything else 0.

#include "IZELServerString.h"

class IZELServerItem {
public:
    virtual void getName(IZELServerString& out) const = 0;
    virtual void getRepositoryName(IZELServerString& out) const = 0;
    // 0 to 4, from the name (see above).
    virtual unsigned getItemType() const = 0;
    virtual void getTitle(IZELServerString& out) const = 0;
    virtual void getDescription(IZELServerString& out) const = 0;
    // Size in bytes as the server reported it.
    virtual int getFileSize() const = 0;
    virtual void getCategory(IZELServerString& out) const = 0;
    virtual void getRequirements(IZELServerString& out) const = 0;
    virtual void getRequirementsKeyword(IZELServerString& out) const = 0;
    virtual void getUsage(IZELServerString& out) const = 0;
    virtual void getHistory(IZELServerString& out) const = 0;
    // As the server wrote it, not interpreted.
    virtual void getLastSaveDate(IZELServerString& out) const = 0;
    virtual void getLastSaveBuild(IZELServerString& out) const = 0;
    virtual int getBuildNumber() const = 0;
    virtual void getLegalTermsAndConditions(IZELServerString& out) const = 0;
    virtual ~IZELServerItem() = default;

protected:
    IZELServerItem() = default;
    IZELServerItem(const IZELServerItem&) = default;
    IZELServerItem& operator=(const IZELServerItem&) = default;
};
