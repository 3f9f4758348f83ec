#pragma once
// What the canned server and the raw client share: frame I/O on a plain descriptor and the exact
// request texts of every exchange the benchmark makes. The server refuses any request that differs
// from these texts by one byte, so a figure can only be produced by byte-identical traffic.

#include <cstddef>
#include <cstdint>
#include <string>
#include <string_view>

namespace bench {

inline constexpr const char* kUser = "bench";
inline constexpr const char* kPassword = "bench-pw";
inline constexpr const char* kResource = "BENCH";
inline constexpr const char* kRepository = "bench";
inline constexpr const char* kUploadPath = "/in/big.dat";
inline constexpr const char* kDownloadPath = "/out/big.dat";
inline constexpr const char* kListPath = "/list";
// File content moves in pieces of this size, as the protocol's own transfers do.
inline constexpr std::size_t kChunk = 131072;

// Whole-buffer send and receive; false when the peer went away or the call failed.
bool sendAll(int fd, const void* data, std::size_t size);
bool receiveAll(int fd, void* data, std::size_t size);
bool sendFrame(int fd, std::string_view payload);
bool receiveFrame(int fd, std::string& payload);

// The payload of a command frame: the version header, then the request text.
std::string commandPayload(std::string_view requestText);

// Request texts, exactly as the library writes them.
std::string signInRequest();
std::string repositoryExistsRequest();
std::string sharedResourceRequest();
std::string uploadRequest();
std::string downloadRequest();
std::string listRequest();

std::string acknowledgement();
std::string fileHeader(std::uint64_t length, std::uint32_t crc);
// Reads "fileLength=N" NUL "fileCRC=C"; false when the payload is no file header.
bool parseFileHeader(std::string_view payload, std::uint64_t& length, std::uint32_t& crc);

// The deterministic content of every transferred file: `size` bytes of a repeating pseudo-random
// pattern, and its CRC-32.
const std::string& contentPattern();
std::uint32_t contentCrc(std::uint64_t size);
// Writes that content into `path`; false on failure.
bool writeContentFile(const std::string& path, std::uint64_t size);
// CRC-32 and length of a file on disk; false when it cannot be read.
bool fileCrc(const std::string& path, std::uint32_t& crc, std::uint64_t& length);

// The body of the canned "SR_LIST" reply: `entries` "FILEINFO" elements shaped as zelserverd
// writes them.
std::string listReplyBody(unsigned entries);

}  // namespace bench
