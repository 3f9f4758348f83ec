#pragma once
// Lists and looks up the server's shared resources (mount points). Owned by the session
// (IZELServerSession::getMountPointManager, which hands it out only for connections made from a host
// and a port); never destroy it yourself. The mount points it fills can talk to the server themselves,
// through the same connection.
//
// Every operation is one exchange with the server and returns null on success or a status that the
// caller destroys with IZELServerSession::destroyStatus; the connection's statuses come back unchanged.

#include "IZELServerMountPoint.h"
#include "IZELServerStatus.h"
#include "IZELServerString.h"
#include "IZELServerVector.h"

class IZELServerMountPointManager {
public:
    // Fills `mountPoints` with one mount point per shared resource. A reply that cannot be read as a
    // list gives 393621, or the XML parser's status.
    virtual IZELServerStatus* getSharedResources(IZELServerVector<IZELServerMountPoint>& mountPoints) = 0;
    // Fills `mountPoint` with the named shared resource. `found` is set to 0 first and to 1 when the
    // server described the resource; a reply that describes none is no failure. A reply that is no
    // XML document gives the parser's status.
    virtual IZELServerStatus* getSharedResource(const IZELServerString& name, IZELServerMountPoint& mountPoint,
                                                unsigned& found) = 0;
    virtual ~IZELServerMountPointManager() = default;

protected:
    IZELServerMountPointManager() = default;
    IZELServerMountPointManager(const IZELServerMountPointManager&) = delete;
    IZELServerMountPointManager& operator=(const IZELServerMountPointManager&) = delete;
};
