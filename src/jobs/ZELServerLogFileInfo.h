#pragma once
// The description of one job's log file (see IZELServerLogFileInfo), and its reader for the reply of
// "LOG_GET_FILEINFO".

#include <cstdint>
#include <string_view>

#include <zelserverapi/IZELServerLogFileInfo.h>

#include "api/heap.h"

namespace zel {

class XmlElement;

struct LogFileInfoFields {
    std::uint32_t size;
};

class ZELServerLogFileInfo final : public IZELServerLogFileInfo, public HeapObject {
public:
    // The size until a description is read: all bits set.
    static constexpr std::uint32_t kUnknownSize = 0xFFFFFFFFu;

    ZELServerLogFileInfo() = default;
    ~ZELServerLogFileInfo() override = default;
    ZELServerLogFileInfo(const ZELServerLogFileInfo&) = delete;
    ZELServerLogFileInfo& operator=(const ZELServerLogFileInfo&) = delete;

    unsigned getSize() const override { return fields_.size; }

    // Reads the "LOGFILEINFO" child of a reply's document element into the size. Always true: a
    // document without that child, or whose "size" does not convert, is still a readable reply.
    bool readFromXml(const XmlElement& documentElement);

private:
    LogFileInfoFields fields_{kUnknownSize};
};

// The reader behind IZELServerResponse::readLogFileInfo: parses `body` and fills `info`. 0; the
// parser's message number when the body is not XML; 393621 when there is no document element or
// `info` is not the library's own log file info.
int readLogFileInfoReply(std::string_view body, IZELServerLogFileInfo& info);

}  // namespace zel
