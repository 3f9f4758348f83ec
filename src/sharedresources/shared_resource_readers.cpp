#include "sharedresources/shared_resource_readers.h"

#include "sharedresources/ZELServerFileInfo.h"
#include "sharedresources/ZELServerMountPoint.h"
#include "transport/object_reader.h"

namespace zel {
namespace {

constexpr std::string_view kSharedResourceTag = "SHAREDRESOURCE";
constexpr std::string_view kFileInfoTag = "FILEINFO";

bool fillFileInfo(ZELServerFileInfo& info, const XmlElement& element) { return info.readFrom(element); }

}  // namespace

int readMountPointReply(std::string_view body, IZELServerChannel* channel, IZELServerMountPoint& mountPoint)
{
    return readFirstObject<ZELServerMountPoint>(body, kSharedResourceTag, mountPoint,
                                                [channel](ZELServerMountPoint& target, const XmlElement& element) {
                                                    target.readFrom(element);
                                                    target.bind(channel);
                                                    return true;
                                                });
}

int readMountPointsReply(std::string_view body, IZELServerChannel* channel,
                         IZELServerVector<IZELServerMountPoint>& mountPoints)
{
    return readObjectList(
        body, kSharedResourceTag, mountPoints, [channel] { return new ZELServerMountPoint(channel); },
        [](ZELServerMountPoint& target, const XmlElement& element) {
            target.readFrom(element);
            return true;
        });
}

int readFileInfoReply(std::string_view body, IZELServerFileInfo& info)
{
    return readFirstObject<ZELServerFileInfo>(body, kFileInfoTag, info, fillFileInfo);
}

int readFileInfosReply(std::string_view body, IZELServerVector<IZELServerFileInfo>& infos)
{
    return readObjectList(
        body, kFileInfoTag, infos, [] { return new ZELServerFileInfo(); }, fillFileInfo);
}

}  // namespace zel
