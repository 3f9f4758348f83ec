#pragma once
// One shared resource on the server (a mount point, "SHAREDRESOURCE") and the file operations inside
// it. Made by IZELServerSession::createMountPoint and filled by
// IZELServerMountPointManager::getSharedResource (or by a list, whose vector owns it), and destroyed by
// the matching session operation. Operations that talk to the server need a session that is still
// connected as it was when the mount point was made.
//
// Paths inside the resource are IZELServerPath objects (make them with createPath); local paths are
// file paths on this machine. Every command returns null on success or a status that the caller
// destroys with IZELServerSession::destroyStatus; the connection's statuses come back unchanged. A
// reply that cannot be read as the object asked for gives 393621, or the XML parser's status. Out
// flags are set to 0 first and then to the server's answer, so they read 0 after any failure.

#include "IZELServerFileInfo.h"
#include "IZELServerPath.h"
#include "IZELServerProgressListener.h"
#include "IZELServerStatus.h"
#include "IZELServerString.h"
#include "IZELServerVector.h"

namespace xercesc_3_2 {
class DOMElement;
}

class IZELServerMountPoint {
public:
    virtual void getName(IZELServerString& out) const = 0;
    virtual void getDisplayName(IZELServerString& out) const = 0;
    virtual void getDescription(IZELServerString& out) const = 0;

    virtual IZELServerStatus* exists(const IZELServerPath& path, unsigned& present) = 0;
    // Downloads `source` into the local file `localTarget` by the download rule of
    // IZELServerRepository.h (393638 names the source's absolute path). With an empty `localTarget`
    // the temporary file is made in the system's folder for temporary files and stays there under
    // its temporary name. `listener` (owned by the caller, may be null) follows the transfer.
    virtual IZELServerStatus* download(const IZELServerPath& source, const IZELServerString& localTarget,
                                       unsigned& received, IZELServerProgressListener* listener) = 0;
    // Uploads the local file `localSource` to `destination`. 393617 ("src", the path) when the local
    // file cannot be opened and read (a missing file, a folder); nothing is sent then. `listener`
    // (owned by the caller, may be null) follows the transfer.
    virtual IZELServerStatus* upload(const IZELServerString& localSource, const IZELServerPath& destination,
                                     IZELServerProgressListener* listener) = 0;
    virtual IZELServerStatus* copy(const IZELServerPath& source, const IZELServerPath& destination) = 0;
    virtual IZELServerStatus* move(const IZELServerPath& source, const IZELServerPath& destination) = 0;

    // Fills `info` with the description of the entry at `path`. `flags` is reserved and must be 0:
    // any other value gives 393617 ("flags", the value) and nothing is sent.
    virtual IZELServerStatus* getFileInfo(const IZELServerPath& path, unsigned flags, IZELServerFileInfo& info) = 0;
    // As getFileInfo with flags 0.
    virtual IZELServerStatus* getFileInfo(const IZELServerPath& path, IZELServerFileInfo& info) = 0;
    // Fills `entries` (cleared first) with the entries of the directory at `path`, in the server's
    // order. With `depth` 0 that is all: one listing. With a larger depth each directory entry is
    // followed by its own entries, listed the same way with depth - 1. When a deeper listing fails,
    // its status is returned and the entries gathered so far stay in `entries`. A listing stops with
    // 393604 once it has met more than 1,000,000 entries in all (each single reply is bounded by the
    // connection's "MAX_REPLY_BYTES" as well).
    virtual IZELServerStatus* list(const IZELServerPath& path, unsigned depth,
                                   IZELServerVector<IZELServerFileInfo>& entries) = 0;
    // As list with depth 0.
    virtual IZELServerStatus* list(const IZELServerPath& path, IZELServerVector<IZELServerFileInfo>& entries) = 0;
    virtual IZELServerStatus* makeDirectory(const IZELServerPath& path) = 0;
    // Deletes the file or directory; `removed` is the server's answer.
    virtual IZELServerStatus* remove(const IZELServerPath& path, unsigned& removed) = 0;

    // Keeps its place in the table; always returns 0.
    virtual unsigned reserved() const = 0;

    // Paths are rooted at the resource: "/in/2024/data.csv" is the file data.csv in the folder in/2024
    // of the resource. The whole (absolute) path of a path is always its directory path joined with
    // its name by exactly one "/": a "/" that the directory path ends with or the name starts with is
    // not doubled, so an empty directory path (the top of the resource) gives "/name".
    //
    // A path from a whole path inside the resource: the name is the text behind its last "/", the
    // directory path the text before it (empty when there is no "/"); the whole path is then joined
    // from these two as above ("/in/a.csv" stays "/in/a.csv", "a.csv" becomes "/a.csv"). Null when
    // memory is exhausted. Release it with releaseObject.
    virtual IZELServerPath* createPath(const IZELServerString& absolutePath) = 0;
    // A path from a directory path and a name, both kept as given; the whole path joins them as above
    // (("in/", "a.csv") gives "in/a.csv"). Null when memory is exhausted.
    virtual IZELServerPath* createPath(const IZELServerString& directoryPath, const IZELServerString& name) = 0;
    // Destroys a path made by createPath; null is ignored.
    virtual void releaseObject(IZELServerPath* path) = 0;

    virtual ~IZELServerMountPoint() = default;

    // Fills the name, display name and description from a "SHAREDRESOURCE" element ("name",
    // "displayname", "description"); used by the library when it reads a reply.
    virtual void readFromXML(const xercesc_3_2::DOMElement& element) = 0;

protected:
    IZELServerMountPoint() = default;
    IZELServerMountPoint(const IZELServerMountPoint&) = default;
    IZELServerMountPoint& operator=(const IZELServerMountPoint&) = default;
};
