#pragma once
// A named service of the server through which registered repository items are run ("SERVICE"): its
// settings, which item kinds may be registered with it, its properties, and the registration of items.
// Made by IZELServerSession::createService (or by a list, whose vector owns it) and destroyed by the
// matching session operation. Setters change only this object; IZELServerRepositoryManager::addService
// and updateService send it. A fresh service has the id "-1", empty texts and every flag 0.
//
// Flags are 1 or 0. Item types: 1 workspace, 2 custom format, 3 custom transformer, 4 template (see
// IZELServerItem). Operations that talk to the server need a session that is still connected as it was
// when the service was made; they return null on success or a status that the caller destroys with
// IZELServerSession::destroyStatus, and the connection's statuses unchanged. Out flags are set to 0
// first, so they read 0 after any failure.

#include "IZELServerItem.h"
#include "IZELServerPropertyAccessor.h"
#include "IZELServerStatus.h"
#include "IZELServerString.h"
#include "IZELServerVector.h"
#include "ZELServerStringDict.h"

class IZELServerService {
public:
    virtual void getName(IZELServerString& out) const = 0;
    virtual void setName(const IZELServerString& name) = 0;
    virtual void getDisplayName(IZELServerString& out) const = 0;
    virtual void setDisplayName(const IZELServerString& displayName) = 0;
    virtual void getDescription(IZELServerString& out) const = 0;
    virtual void setDescription(const IZELServerString& description) = 0;
    // How the service's URLs are made.
    virtual void getUrlPattern(IZELServerString& out) const = 0;
    virtual void setUrlPattern(const IZELServerString& urlPattern) = 0;
    virtual unsigned isEnabled() const = 0;
    virtual void setEnabled(unsigned enabled) = 0;

    // The service's own properties (owned by the service); edit them here and send them with
    // updatePropertyAccessor.
    virtual IZELServerPropertyAccessor& getPropertyAccessor() = 0;
    // Sends `accessor` as this service's properties, addressed by the service's id.
    virtual IZELServerStatus* updatePropertyAccessor(const IZELServerPropertyAccessor& accessor) = 0;

    virtual unsigned isWorkspaceRegistrationAllowed() const = 0;
    virtual void setWorkspaceRegistrationAllowed(unsigned allowed) = 0;
    // The flag of one item type; 0 for any type other than 1 to 4.
    virtual unsigned isRegistrationAllowed(unsigned itemType) const = 0;
    // Sets the flag of one item type; other types are ignored.
    virtual void setRegistrationAllowed(unsigned itemType, unsigned allowed) = 0;

    // Whether the item is registered with this service (the server's answer).
    virtual IZELServerStatus* itemRegistered(const IZELServerString& repositoryName, const IZELServerString& itemName,
                                             unsigned& registered) = 0;
    // Registers the item. Checked locally first, with nothing sent: 393619 for an empty item name,
    // 393635 when this service does not take the item's type (a name with none of the four endings
    // is always refused).
    virtual IZELServerStatus* registerItem(const IZELServerString& repositoryName,
                                           const IZELServerString& itemName) = 0;
    // `deregistered` is the server's answer.
    virtual IZELServerStatus* deregisterItem(const IZELServerString& repositoryName, const IZELServerString& itemName,
                                             unsigned& deregistered) = 0;
    // Appends the items registered with this service to `items` (cleared first). `directives` may be
    // null; its key "ITEM_TYPE", when present, asks the server for items of that type only.
    virtual IZELServerStatus* getRegisteredItems(const ZELServerStringDict* directives,
                                                 IZELServerVector<IZELServerItem>& items) = 0;

    virtual ~IZELServerService() = default;

protected:
    IZELServerService() = default;
    IZELServerService(const IZELServerService&) = default;
    IZELServerService& operator=(const IZELServerService&) = default;
};
