#include "sharedresources/ZELServerMountPoint.h"

#include <memory>
#include <optional>
#include <utility>
#include <vector>

#include <xercesc/dom/DOMElement.hpp>

#include "api/exception_guard.h"
#include "api/ZELServerString.h"
#include "api/ZELServerVector.h"
#include "api/conversions.h"
#include "api/message_numbers.h"
#include "api/status.h"
#include "sharedresources/ZELServerFileInfo.h"
#include "sharedresources/ZELServerPath.h"
#include "transport/LocalFile.h"
#include "transport/attribute_binding.h"
#include "transport/checked_command.h"
#include "transport/xml_document.h"
#include "transport/xml_navigation.h"

namespace zel {
namespace {

constexpr const char* kResourceName = "srName";
constexpr const char* kPathValue = "srPath";
constexpr const char* kSourcePath = "srSrcPath";
constexpr const char* kDestinationPath = "srDestPath";
// Both transfers ask the server to check the file against the CRC in its header.
constexpr const char* kCrcChecking = "itemFileCRCCheckingEnabled";

constexpr AttributeBinding<MountPointFields> kMountPointAttributes[] = {
    {"name", &MountPointFields::name},
    {"displayname", &MountPointFields::displayName},
    {"description", &MountPointFields::description},
};

// The stream opening is not enough: on POSIX a directory opens for reading and fails only at the
// first read, which would be after the command had gone out.
bool canBeRead(const std::string& path)
{
    LocalFile file(path);
    char probe = 0;
    return file.isOpen() && file.read(&probe, 1).has_value();
}

}  // namespace

void ZELServerMountPoint::getName(IZELServerString& out) const { handOutText(fields_.name, out); }

void ZELServerMountPoint::getDisplayName(IZELServerString& out) const { handOutText(fields_.displayName, out); }

void ZELServerMountPoint::getDescription(IZELServerString& out) const { handOutText(fields_.description, out); }

CheckedCommand ZELServerMountPoint::on(const char* keyword, Where where) const
{
    CheckedCommand command(channel_, keyword, where);
    command.add(kResourceName, fields_.name);
    return command;
}

IZELServerStatus* ZELServerMountPoint::exists(const IZELServerPath& path, unsigned& present)
{
    return guarded([&] { return on("SR_EXISTS").addPath(kPathValue, path).askFlag(present); });
}

IZELServerStatus* ZELServerMountPoint::download(const IZELServerPath& source, const IZELServerString& localTarget,
                                                unsigned& received, IZELServerProgressListener* listener)
{
    return guarded([&] {
        ZELServerString sourcePath;
        source.getAbsolutePath(sourcePath);
        return on("SR_DOWNLOAD")
            .addPath(kSourcePath, source)
            .add(kCrcChecking, "true")
            .download({toStdString(localTarget), sourcePath.str()}, received, listener);
    });
}

IZELServerStatus* ZELServerMountPoint::upload(const IZELServerString& localSource, const IZELServerPath& destination,
                                              IZELServerProgressListener* listener)
{
    return guarded([&] {
        const std::string source = toStdString(localSource);
        return on("SR_UPLOAD")
            .check(canBeRead(source), msg::kInvalidArgument, {"src", source})
            .addPath(kDestinationPath, destination)
            .add(kCrcChecking, "true")
            .upload(localSource, listener);
    });
}

IZELServerStatus* ZELServerMountPoint::copy(const IZELServerPath& source, const IZELServerPath& destination)
{
    return guarded(
        [&] { return on("SR_COPY").addPath(kSourcePath, source).addPath(kDestinationPath, destination).send(); });
}

IZELServerStatus* ZELServerMountPoint::move(const IZELServerPath& source, const IZELServerPath& destination)
{
    return guarded(
        [&] { return on("SR_MOVE").addPath(kSourcePath, source).addPath(kDestinationPath, destination).send(); });
}

IZELServerStatus* ZELServerMountPoint::getFileInfo(const IZELServerPath& path, unsigned flags, IZELServerFileInfo& info)
{
    return guarded([&]() -> IZELServerStatus* {
        return on("SR_GET")
            .check(flags == 0, msg::kInvalidArgument, {"flags", decimalText(flags)})
            .addPath(kPathValue, path)
            .askParsed([&info](const IZELServerResponse& response) { return response.readFileInfo(info); });
    });
}

IZELServerStatus* ZELServerMountPoint::getFileInfo(const IZELServerPath& path, IZELServerFileInfo& info)
{
    return getFileInfo(path, 0, info);
}

IZELServerStatus* ZELServerMountPoint::listOnce(const IZELServerPath& path,
                                                IZELServerVector<IZELServerFileInfo>& entries)
{
    return on("SR_LIST").addPath(kPathValue, path).askParsed([&entries](const IZELServerResponse& response) {
        return response.readFileInfos(entries);
    });
}

IZELServerStatus* ZELServerMountPoint::list(const IZELServerPath& path, unsigned depth,
                                            IZELServerVector<IZELServerFileInfo>& entries)
{
    return guarded([&] { return listWithin(path, depth, entries, kMaxListedEntries); });
}

IZELServerStatus* ZELServerMountPoint::listWithin(const IZELServerPath& path, unsigned depth,
                                                  IZELServerVector<IZELServerFileInfo>& entries, std::size_t limit)
{
    entries.clearAndDestroy();
    using Listing = ZELServerVector<IZELServerFileInfo, ZELServerFileInfo>;
    // One listing per directory still being walked: its entries not yet handed on, and its level.
    // The walk is depth first without recursion, and every entry is appended once, so a server that
    // reports a directory inside itself costs round trips up to the caller's depth, never the stack,
    // and a long listing costs time linear in its length.
    struct Open {
        std::unique_ptr<Listing> listing;
        unsigned next = 0;
        unsigned level = 0;
    };
    std::vector<Open> open;
    open.push_back({std::make_unique<Listing>(), 0, 0});
    if (IZELServerStatus* status = listOnce(path, *open.back().listing)) {
        return status;
    }
    std::size_t total = open.back().listing->entries();
    while (!open.empty()) {
        Open& top = open.back();
        if (top.next == top.listing->entries()) {
            open.pop_back();
            continue;
        }
        IZELServerFileInfo* entry = std::exchange(top.listing->element(top.next++), nullptr);
        const unsigned level = top.level;
        appendOrThrow(entries, entry);
        if (entry == nullptr || !entry->isDirectory() || level >= depth) {
            continue;
        }
        auto children = std::make_unique<Listing>();
        IZELServerStatus* status = listOnce(entry->getPath(), *children);
        total += children->entries();
        if (status == nullptr && total > limit) {
            status = makeStatus(msg::kUnexpectedReply, "a listing of more than " + decimalText(limit) + " entries");
        }
        if (status != nullptr) {
            // What was listed before stays, without the unlisted directories' own entries.
            for (auto frame = open.rbegin(); frame != open.rend(); ++frame) {
                while (frame->next < frame->listing->entries()) {
                    appendOrThrow(entries, std::exchange(frame->listing->element(frame->next++), nullptr));
                }
            }
            return status;
        }
        open.push_back({std::move(children), 0, level + 1});
    }
    return nullptr;
}

IZELServerStatus* ZELServerMountPoint::list(const IZELServerPath& path, IZELServerVector<IZELServerFileInfo>& entries)
{
    return list(path, 0, entries);
}

IZELServerStatus* ZELServerMountPoint::makeDirectory(const IZELServerPath& path)
{
    return guarded([&] { return on("SR_MAKE").addPath(kPathValue, path).send(); });
}

IZELServerStatus* ZELServerMountPoint::remove(const IZELServerPath& path, unsigned& removed)
{
    return guarded([&] { return on("SR_DELETE").addPath(kPathValue, path).askFlag(removed); });
}

IZELServerPath* ZELServerMountPoint::createPath(const IZELServerString& absolutePath)
{
    return guarded([&] { return ZELServerPath::fromWholePath(toStdString(absolutePath)); });
}

IZELServerPath* ZELServerMountPoint::createPath(const IZELServerString& directoryPath, const IZELServerString& name)
{
    return guarded([&] { return ZELServerPath::fromParts(toStdString(directoryPath), toStdString(name)); });
}

void ZELServerMountPoint::releaseObject(IZELServerPath* path) { delete path; }

void ZELServerMountPoint::readFromXML(const xercesc_3_2::DOMElement& element)
{
    guarded([&] {
        // The navigation helpers work on wrappers; these live only for this reading.
        ZELServerDOMNodeList wrappers;
        if (const XmlElement* wrapped = wrappers.wrap(const_cast<xercesc::DOMElement*>(&element))) {
            readFrom(*wrapped);
        }
    });
}

void ZELServerMountPoint::readFrom(const XmlElement& element)
{
    readAttributes(element, fields_, kMountPointAttributes);
}

}  // namespace zel
