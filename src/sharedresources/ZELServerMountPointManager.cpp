#include "sharedresources/ZELServerMountPointManager.h"

#include "api/exception_guard.h"
#include "api/message_numbers.h"
#include "api/status.h"
#include "transport/checked_command.h"

namespace zel {

IZELServerStatus* ZELServerMountPointManager::getSharedResources(IZELServerVector<IZELServerMountPoint>& mountPoints)
{
    return guarded([&]() -> IZELServerStatus* {
        return CheckedCommand(channel_, "SR_GET_SHAREDRESOURCES")
            .askParsed(
                [&mountPoints](const IZELServerResponse& response) { return response.readMountPoints(mountPoints); });
    });
}

IZELServerStatus* ZELServerMountPointManager::getSharedResource(const IZELServerString& name,
                                                                IZELServerMountPoint& mountPoint, unsigned& found)
{
    return guarded([&]() -> IZELServerStatus* {
        return CheckedCommand(channel_, "SR_GET_SHAREDRESOURCE")
            .add("srName", name)
            .run(found, [&](Command& command) -> IZELServerStatus* {
                if (IZELServerStatus* status = command.send()) {
                    return status;
                }
                const int code = command.response().readMountPoint(mountPoint);
                found = code == 0 ? 1 : 0;
                // The server answers an unknown name with a document that holds no resource.
                return code == 0 || code == static_cast<int>(msg::kUnreadableReply)
                           ? nullptr
                           : makeStatus(static_cast<unsigned>(code));
            });
    });
}

}  // namespace zel
