#pragma once
// What the session makes of this subsystem. Each returns a new object the caller owns (destroyed
// through its interface), or null when memory is exhausted.

#include <zelserverapi/IZELServerFileInfo.h>
#include <zelserverapi/IZELServerMountPoint.h>
#include <zelserverapi/IZELServerMountPointManager.h>
#include <zelserverapi/IZELServerVector.h>

#include "transport/IZELServerChannel.h"

namespace zel {

// Both bound to `channel`, which they borrow: the channel must outlive them. With a null channel
// every command answers 393622.
IZELServerMountPointManager* makeMountPointManager(IZELServerChannel* channel);
IZELServerMountPoint* makeMountPoint(IZELServerChannel* channel);

// An empty description (no path, not a directory, size 0).
IZELServerFileInfo* makeFileInfo();

// Empty vectors that own the elements the readers put in them.
IZELServerVector<IZELServerMountPoint>* makeMountPointVector();
IZELServerVector<IZELServerFileInfo>* makeFileInfoVector();

}  // namespace zel
