#include "sharedresources/ZELServerMountPoint.h"

#include <optional>
#include <vector>

#include <xercesc/dom/DOMElement.hpp>

#include "api/ZELServerString.h"
#include "api/ZELServerVector.h"
#include "api/conversions.h"
#include "api/message_numbers.h"
#include "api/status.h"
#include "sharedresources/ZELServerFileInfo.h"
#include "sharedresources/ZELServerPath.h"
#include "sharedresources/temporary_file.h"
#include "transport/LocalFile.h"
#include "transport/command.h"
#include "transport/xml_element.h"
#include "transport/xml_navigation.h"
#include "transport/xml_node_list.h"

namespace zel {
namespace {

constexpr const char* kResourceName = "srName";
constexpr const char* kPathValue = "srPath";
constexpr const char* kSourcePath = "srSrcPath";
constexpr const char* kDestinationPath = "srDestPath";
// Both transfers ask the server to check the file against the CRC in its header.
constexpr const char* kCrcChecking = "itemFileCRCCheckingEnabled";

void copyOut(const std::string& text, IZELServerString& out)
{
    out.set(text.data(), static_cast<unsigned>(text.size()));
}

IZELServerStatus* notConnected() { return makeStatus(msg::kNotConnected); }

IZELServerStatus* readingStatus(int code) { return code == 0 ? nullptr : makeStatus(static_cast<unsigned>(code)); }

// The stream opening is not enough: on POSIX a directory opens for reading and fails only at the
// first read, which would be after the command had gone out.
bool canBeRead(const std::string& path)
{
    LocalFile file(path, LocalFile::Mode::Read);
    char probe = 0;
    return file.isOpen() && file.read(&probe, 1).has_value();
}

}  // namespace

void ZELServerMountPoint::getName(IZELServerString& out) const { copyOut(name_, out); }

void ZELServerMountPoint::getDisplayName(IZELServerString& out) const { copyOut(displayName_, out); }

void ZELServerMountPoint::getDescription(IZELServerString& out) const { copyOut(description_, out); }

IZELServerStatus* ZELServerMountPoint::addValues(Command& command, std::initializer_list<PathValue> paths) const
{
    command.add(kResourceName, name_);
    if (!command.ready()) {
        return nullptr;  // send() reports it
    }
    for (const auto& [valueName, path] : paths) {
        // A path that cannot be written as a document (a NUL in it) would reach the server as a
        // command without its path; refusing it here keeps the connection out of it.
        if (const int code = command.request().addPathPayload(valueName, *path); code != 0) {
            return makeStatus(static_cast<unsigned>(code), std::string(valueName));
        }
    }
    return nullptr;
}

IZELServerStatus* ZELServerMountPoint::statusCommand(const char* keyword, std::initializer_list<PathValue> paths)
{
    if (channel_ == nullptr) {
        return notConnected();
    }
    Command command(*channel_, keyword);
    if (IZELServerStatus* status = addValues(command, paths)) {
        return status;
    }
    return command.send();
}

IZELServerStatus* ZELServerMountPoint::flagCommand(const char* keyword, const IZELServerPath& path, unsigned& flag)
{
    flag = 0;
    if (channel_ == nullptr) {
        return notConnected();
    }
    Command command(*channel_, keyword);
    if (IZELServerStatus* status = addValues(command, {{kPathValue, &path}})) {
        return status;
    }
    if (IZELServerStatus* status = command.send()) {
        return status;
    }
    // A body that is no boolean leaves the flag at 0, the answer that promises nothing.
    command.response().readBoolean(flag);
    return nullptr;
}

IZELServerStatus* ZELServerMountPoint::exists(const IZELServerPath& path, unsigned& present)
{
    return flagCommand("SR_EXISTS", path, present);
}

IZELServerStatus* ZELServerMountPoint::download(const IZELServerPath& source, const IZELServerString& localTarget,
                                                unsigned& received, IZELServerProgressListener* listener)
{
    received = 0;
    if (channel_ == nullptr) {
        return notConnected();
    }
    const std::string target = toStdString(localTarget);
    const std::string directory = TemporaryFile::directoryFor(target);
    // Made before anything is sent: a target in a folder that cannot be written fails here, with
    // the connection untouched.
    std::optional<TemporaryFile> temporary = TemporaryFile::createIn(directory);
    if (!temporary) {
        return makeStatus(msg::kLocalFileWrite, target.empty() ? directory : target);
    }
    Command command(*channel_, "SR_DOWNLOAD");
    if (IZELServerStatus* status = addValues(command, {{kSourcePath, &source}})) {
        return status;
    }
    command.add(kCrcChecking, "true");
    if (IZELServerStatus* status = command.transfer(temporary->path(), kDownload, listener)) {
        return status;  // the temporary file goes with `temporary`; the target was never touched
    }
    // A server that sent no file is answered "false" by the channel; the (empty) temporary file still
    // takes the target's place, as a completed exchange always does here.
    command.response().readBoolean(received);
    if (target.empty()) {
        temporary->keep();
        return nullptr;
    }
    if (!temporary->moveTo(target)) {
        return makeStatus(msg::kLocalFileWrite, target);
    }
    return nullptr;
}

IZELServerStatus* ZELServerMountPoint::upload(const IZELServerString& localSource, const IZELServerPath& destination,
                                              IZELServerProgressListener* listener)
{
    const std::string source = toStdString(localSource);
    if (!canBeRead(source)) {
        return makeStatus(msg::kInvalidArgument, std::vector<std::string>{"src", source});
    }
    if (channel_ == nullptr) {
        return notConnected();
    }
    Command command(*channel_, "SR_UPLOAD");
    if (IZELServerStatus* status = addValues(command, {{kDestinationPath, &destination}})) {
        return status;
    }
    command.add(kCrcChecking, "true");
    return command.transfer(source, kUpload, listener);
}

IZELServerStatus* ZELServerMountPoint::copy(const IZELServerPath& source, const IZELServerPath& destination)
{
    return statusCommand("SR_COPY", {{kSourcePath, &source}, {kDestinationPath, &destination}});
}

IZELServerStatus* ZELServerMountPoint::move(const IZELServerPath& source, const IZELServerPath& destination)
{
    return statusCommand("SR_MOVE", {{kSourcePath, &source}, {kDestinationPath, &destination}});
}

IZELServerStatus* ZELServerMountPoint::getFileInfo(const IZELServerPath& path, unsigned flags, IZELServerFileInfo& info)
{
    if (flags != 0) {
        return makeStatus(msg::kInvalidArgument, std::vector<std::string>{"flags", decimalText(flags)});
    }
    if (channel_ == nullptr) {
        return notConnected();
    }
    Command command(*channel_, "SR_GET");
    if (IZELServerStatus* status = addValues(command, {{kPathValue, &path}})) {
        return status;
    }
    if (IZELServerStatus* status = command.send()) {
        return status;
    }
    return readingStatus(command.response().readFileInfo(info));
}

IZELServerStatus* ZELServerMountPoint::getFileInfo(const IZELServerPath& path, IZELServerFileInfo& info)
{
    return getFileInfo(path, 0, info);
}

IZELServerStatus* ZELServerMountPoint::listOnce(const IZELServerPath& path,
                                                IZELServerVector<IZELServerFileInfo>& entries)
{
    if (channel_ == nullptr) {
        return notConnected();
    }
    Command command(*channel_, "SR_LIST");
    if (IZELServerStatus* status = addValues(command, {{kPathValue, &path}})) {
        return status;
    }
    if (IZELServerStatus* status = command.send()) {
        return status;
    }
    return readingStatus(command.response().readFileInfos(entries));
}

IZELServerStatus* ZELServerMountPoint::list(const IZELServerPath& path, unsigned depth,
                                            IZELServerVector<IZELServerFileInfo>& entries)
{
    entries.clearAndDestroy();
    if (IZELServerStatus* status = listOnce(path, entries)) {
        return status;
    }
    // Deeper listings are spliced in right behind their directory, so the walk needs no recursion:
    // a server that reports a directory inside itself costs round trips up to the caller's depth,
    // never the stack.
    std::vector<unsigned> levels(entries.entries(), 0);
    for (unsigned i = 0; i < entries.entries(); ++i) {
        const IZELServerFileInfo* entry = entries.element(i);
        if (entry == nullptr || !entry->isDirectory() || levels[i] >= depth) {
            continue;
        }
        ZELServerVector<IZELServerFileInfo, ZELServerFileInfo> children;
        if (IZELServerStatus* status = listOnce(entry->getPath(), children)) {
            return status;
        }
        const unsigned count = children.entries();
        for (unsigned k = 0; k < count; ++k) {
            entries.insertAt(i + 1 + k, children.at(k));
        }
        children.clear();  // `entries` owns them now
        levels.insert(levels.begin() + i + 1, count, levels[i] + 1);
    }
    return nullptr;
}

IZELServerStatus* ZELServerMountPoint::list(const IZELServerPath& path, IZELServerVector<IZELServerFileInfo>& entries)
{
    return list(path, 0, entries);
}

IZELServerStatus* ZELServerMountPoint::makeDirectory(const IZELServerPath& path)
{
    return statusCommand("SR_MAKE", {{kPathValue, &path}});
}

IZELServerStatus* ZELServerMountPoint::remove(const IZELServerPath& path, unsigned& removed)
{
    return flagCommand("SR_DELETE", path, removed);
}

IZELServerPath* ZELServerMountPoint::createPath(const IZELServerString& absolutePath)
{
    return ZELServerPath::fromWholePath(toStdString(absolutePath));
}

IZELServerPath* ZELServerMountPoint::createPath(const IZELServerString& directoryPath, const IZELServerString& name)
{
    return ZELServerPath::fromParts(toStdString(directoryPath), toStdString(name));
}

void ZELServerMountPoint::releaseObject(IZELServerPath* path) { delete path; }

void ZELServerMountPoint::readFromXML(const xercesc_3_2::DOMElement& element)
{
    // The navigation helpers work on wrappers; these live only for this reading.
    ZELServerDOMNodeList wrappers;
    if (const XmlElement* wrapped = wrappers.wrap(const_cast<xercesc::DOMElement*>(&element))) {
        readFrom(*wrapped);
    }
}

void ZELServerMountPoint::readFrom(const XmlElement& element)
{
    getAttribute(&element, "name", name_);
    getAttribute(&element, "displayname", displayName_);
    getAttribute(&element, "description", description_);
}

}  // namespace zel
