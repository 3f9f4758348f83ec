#pragma once
// One shared resource (mount point) and the "SR_" file commands inside it, over the channel it was
// made or read with.

#include <cstddef>
#include <string>

#include <zelserverapi/IZELServerMountPoint.h>

#include "api/heap.h"
#include "transport/IZELServerChannel.h"
#include "transport/checked_command.h"

namespace zel {

class XmlElement;

struct MountPointFields {
    std::string name;
    std::string displayName;
    std::string description;
};

class ZELServerMountPoint final : public IZELServerMountPoint, public HeapObject {
public:
    // `channel` is borrowed and must outlive every command; a mount point without a channel answers
    // every command with 393622.
    explicit ZELServerMountPoint(IZELServerChannel* channel) : channel_(channel) {}
    ~ZELServerMountPoint() override = default;
    ZELServerMountPoint(const ZELServerMountPoint&) = delete;
    ZELServerMountPoint& operator=(const ZELServerMountPoint&) = delete;

    // Rebinds the mount point to the channel of the reply that describes it.
    void bind(IZELServerChannel* channel) { channel_ = channel; }
    IZELServerChannel* channel() const { return channel_; }

    void getName(IZELServerString& out) const override;
    void getDisplayName(IZELServerString& out) const override;
    void getDescription(IZELServerString& out) const override;

    IZELServerStatus* exists(const IZELServerPath& path, unsigned& present) override;
    IZELServerStatus* download(const IZELServerPath& source, const IZELServerString& localTarget, unsigned& received,
                               IZELServerProgressListener* listener) override;
    IZELServerStatus* upload(const IZELServerString& localSource, const IZELServerPath& destination,
                             IZELServerProgressListener* listener) override;
    IZELServerStatus* copy(const IZELServerPath& source, const IZELServerPath& destination) override;
    IZELServerStatus* move(const IZELServerPath& source, const IZELServerPath& destination) override;
    IZELServerStatus* getFileInfo(const IZELServerPath& path, unsigned flags, IZELServerFileInfo& info) override;
    IZELServerStatus* getFileInfo(const IZELServerPath& path, IZELServerFileInfo& info) override;
    IZELServerStatus* list(const IZELServerPath& path, unsigned depth,
                           IZELServerVector<IZELServerFileInfo>& entries) override;
    IZELServerStatus* list(const IZELServerPath& path, IZELServerVector<IZELServerFileInfo>& entries) override;

    // The most entries list() gathers with depth, over all its directories together.
    static constexpr std::size_t kMaxListedEntries = 1000000;
    // list() with a bound of `limit` entries in all.
    IZELServerStatus* listWithin(const IZELServerPath& path, unsigned depth,
                                 IZELServerVector<IZELServerFileInfo>& entries, std::size_t limit);
    IZELServerStatus* makeDirectory(const IZELServerPath& path) override;
    IZELServerStatus* remove(const IZELServerPath& path, unsigned& removed) override;
    unsigned reserved() const override { return 0; }
    IZELServerPath* createPath(const IZELServerString& absolutePath) override;
    IZELServerPath* createPath(const IZELServerString& directoryPath, const IZELServerString& name) override;
    void releaseObject(IZELServerPath* path) override;
    void readFromXML(const xercesc_3_2::DOMElement& element) override;

    // Replaces the name, display name and description with the attributes "name", "displayname" and
    // "description" of a "SHAREDRESOURCE" element (absent ones read as empty).
    void readFrom(const XmlElement& element);

private:
    // A command inside this mount point: `keyword` with "srName" as its first value.
    CheckedCommand on(const char* keyword, Where where = Where::current()) const;
    // One "SR_LIST" reply read into `entries` (which the reader clears first).
    IZELServerStatus* listOnce(const IZELServerPath& path, IZELServerVector<IZELServerFileInfo>& entries);

    IZELServerChannel* channel_;
    MountPointFields fields_;
};

}  // namespace zel
