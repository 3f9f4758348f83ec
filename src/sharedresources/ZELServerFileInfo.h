#pragma once
// The description of one file or directory in a shared resource ("FILEINFO").

#include <cstdint>
#include <string>

#include <zelserverapi/IZELServerFileInfo.h>

#include "api/heap.h"
#include "sharedresources/ZELServerPath.h"

namespace zel {

class XmlElement;

struct FileInfoFields {
    bool directory = false;
    std::uint32_t size = 0;
    std::string date;
};

class ZELServerFileInfo final : public IZELServerFileInfo, public HeapObject {
public:
    // An empty path, not a directory, size 0, no date.
    ZELServerFileInfo() = default;
    ~ZELServerFileInfo() override = default;
    ZELServerFileInfo(const ZELServerFileInfo&) = delete;
    ZELServerFileInfo& operator=(const ZELServerFileInfo&) = delete;

    const IZELServerPath& getPath() const override { return path_; }
    bool isDirectory() const override { return fields_.directory; }
    unsigned getSize() const override { return fields_.size; }
    void getDate(IZELServerString& out) const override;

    // Replaces every field from a "FILEINFO" element: "filetype" (a directory exactly when it is
    // "DIR"), "size" (an unsigned number, decimal or 0x hexadecimal; a negative, malformed or
    // too large size reads as 0) and "date" as text. The path comes from the element's "PATH" child
    // when it has one, else from the element's own "name", "dirpath" and "abspath". Never refuses the
    // element; returns true so that it can serve as the response's fill function.
    bool readFrom(const XmlElement& element);

private:
    ZELServerPath path_;
    FileInfoFields fields_;
};

}  // namespace zel
