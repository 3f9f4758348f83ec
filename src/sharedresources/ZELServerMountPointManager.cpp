#include "sharedresources/ZELServerMountPointManager.h"

#include "api/message_numbers.h"
#include "api/status.h"
#include "transport/command.h"

namespace zel {

IZELServerStatus* ZELServerMountPointManager::getSharedResources(IZELServerVector<IZELServerMountPoint>& mountPoints)
{
    if (channel_ == nullptr) {
        return makeStatus(msg::kNotConnected);
    }
    Command command(*channel_, "SR_GET_SHAREDRESOURCES");
    if (IZELServerStatus* status = command.send()) {
        return status;
    }
    const int code = command.response().readMountPoints(mountPoints);
    return code == 0 ? nullptr : makeStatus(static_cast<unsigned>(code));
}

IZELServerStatus* ZELServerMountPointManager::getSharedResource(const IZELServerString& name,
                                                                IZELServerMountPoint& mountPoint, unsigned& found)
{
    found = 0;
    if (channel_ == nullptr) {
        return makeStatus(msg::kNotConnected);
    }
    Command command(*channel_, "SR_GET_SHAREDRESOURCE");
    command.add("srName", name);
    if (IZELServerStatus* status = command.send()) {
        return status;
    }
    const int code = command.response().readMountPoint(mountPoint);
    if (code == 0) {
        found = 1;
        return nullptr;
    }
    // The server answers an unknown name with a document that holds no resource.
    return code == static_cast<int>(msg::kUnreadableReply) ? nullptr : makeStatus(static_cast<unsigned>(code));
}

}  // namespace zel
