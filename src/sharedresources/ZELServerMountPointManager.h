#pragma once
// The mount point manager: lists and looks up the server's shared resources over the session's
// channel.

#include <zelserverapi/IZELServerMountPointManager.h>

#include "api/heap.h"
#include "transport/IZELServerChannel.h"

namespace zel {

class ZELServerMountPointManager final : public IZELServerMountPointManager, public HeapObject {
public:
    // `channel` is borrowed (the session owns it); the mount points read here are bound to it. A
    // manager without a channel answers every command with 393622.
    explicit ZELServerMountPointManager(IZELServerChannel* channel) : channel_(channel) {}
    ~ZELServerMountPointManager() override = default;

    IZELServerStatus* getSharedResources(IZELServerVector<IZELServerMountPoint>& mountPoints) override;
    // A reply without a "SHAREDRESOURCE" element is the server's "no such resource": found stays 0
    // and the result is null. A reply that is no XML document gives the parser's status.
    IZELServerStatus* getSharedResource(const IZELServerString& name, IZELServerMountPoint& mountPoint,
                                        unsigned& found) override;

private:
    IZELServerChannel* channel_;
};

}  // namespace zel
