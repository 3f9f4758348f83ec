#pragma once
// The limits a connection puts on what the server may cost the client: how long to wait and how
// large a reply may be. Read from the connection properties at every open:
//
//   "CONNECT_TIMEOUT"      seconds to wait for the connection to the server (default 30)
//   "IO_TIMEOUT"           seconds each single send or receive may wait (default: no limit)
//   "RESULT_PORT_TIMEOUT"  seconds to wait for the server to call back with a job's result (default:
//                          no limit)
//   "MAX_REPLY_BYTES"      the largest frame accepted from the server, in bytes (default 67108864)
//
// Seconds are decimal with at most three decimals ("30", "0.25"); 0 means no limit. Byte counts are
// whole decimal numbers from 1 to 4294967295.

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>

#include <zelserverapi/IZELServerConnectionInfo.h>
#include <zelserverapi/IZELServerStatus.h>

#include "transport/frame_reader.h"

namespace zel {

inline constexpr const char* kConnectTimeoutProperty = "CONNECT_TIMEOUT";
inline constexpr const char* kIoTimeoutProperty = "IO_TIMEOUT";
inline constexpr const char* kResultPortTimeoutProperty = "RESULT_PORT_TIMEOUT";
inline constexpr const char* kMaxReplyBytesProperty = "MAX_REPLY_BYTES";

// Time-outs in milliseconds, 0 for none.
struct ConnectionLimits {
    std::uint32_t connectTimeoutMs = 30000;
    std::uint32_t ioTimeoutMs = 0;
    std::uint32_t resultPortTimeoutMs = 0;
    std::uint32_t maxReplyBytes = wire::kDefaultMaxReplyBytes;
};

// Milliseconds of a seconds text as described above; nullopt when it is no such text or exceeds
// about 24 days (the millisecond count must fit the platforms' 32-bit time-outs).
std::optional<std::uint32_t> secondsAsMilliseconds(std::string_view text);

// A byte count as described above; nullopt otherwise.
std::optional<std::uint32_t> byteCount(std::string_view text);

// Reads the four properties over the defaults. A property that is present but does not convert gives
// status 393617 with its name and value, and `limits` is left as it was.
IZELServerStatus* readConnectionLimits(const IZELServerConnectionInfo& info, ConnectionLimits& limits);

}  // namespace zel
