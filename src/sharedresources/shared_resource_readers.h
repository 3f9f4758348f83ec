#pragma once
// The readers of shared resource replies ("SHAREDRESOURCE", "FILEINFO"), over a reply body. The
// response's reader slots call these; they are the object_reader.h templates with this
// subsystem's fill functions, so results are as there: 0; the parser's message number when the
// body is not XML; 393621 when the element is missing or the object is not the library's own.

#include <string_view>

#include <zelserverapi/IZELServerFileInfo.h>
#include <zelserverapi/IZELServerMountPoint.h>
#include <zelserverapi/IZELServerVector.h>

#include "transport/IZELServerChannel.h"

namespace zel {

// Fills `mountPoint` from the first "SHAREDRESOURCE" element and binds it to `channel`.
int readMountPointReply(std::string_view body, IZELServerChannel* channel, IZELServerMountPoint& mountPoint);
// Replaces the content of `mountPoints` with one mount point per "SHAREDRESOURCE" element, each
// bound to `channel`.
int readMountPointsReply(std::string_view body, IZELServerChannel* channel,
                         IZELServerVector<IZELServerMountPoint>& mountPoints);
// Fills `info` from the first "FILEINFO" element.
int readFileInfoReply(std::string_view body, IZELServerFileInfo& info);
// Replaces the content of `infos` with one file info per "FILEINFO" element.
int readFileInfosReply(std::string_view body, IZELServerVector<IZELServerFileInfo>& infos);

}  // namespace zel
