#include "sharedresources/sharedresources_factories.h"

#include "api/ZELServerVector.h"
#include "sharedresources/ZELServerFileInfo.h"
#include "sharedresources/ZELServerMountPoint.h"
#include "sharedresources/ZELServerMountPointManager.h"

namespace zel {

IZELServerMountPointManager* makeMountPointManager(IZELServerChannel* channel)
{
    return new ZELServerMountPointManager(channel);
}

IZELServerMountPoint* makeMountPoint(IZELServerChannel* channel) { return new ZELServerMountPoint(channel); }

IZELServerFileInfo* makeFileInfo() { return new ZELServerFileInfo(); }

IZELServerVector<IZELServerMountPoint>* makeMountPointVector()
{
    return new ZELServerVector<IZELServerMountPoint, ZELServerMountPoint>();
}

IZELServerVector<IZELServerFileInfo>* makeFileInfoVector()
{
    return new ZELServerVector<IZELServerFileInfo, ZELServerFileInfo>();
}

}  // namespace zel
