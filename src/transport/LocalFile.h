#pragma once
// A local file that travels with a command: its path and an open binary stream. The caller opens it
// for reading (upload) or writing (download) before anything is sent, so a bad path is reported
// while the connection is still in step. The stream is closed by close() or the destructor.

#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <fstream>
#include <optional>
#include <string>

#include "api/heap.h"

namespace zel {

class LocalFile : public HeapObject {
public:
    enum class Mode {
        Read,   // an existing file, from its start
        Write,  // through a stream the caller opened
    };

    // Reads an existing file from its start (Mode::Read).
    explicit LocalFile(std::string path);
    // Writes through a stream the caller opened (Mode::Write); the file takes it over and closes it.
    LocalFile(std::string path, std::FILE* writer);
    ~LocalFile();

    LocalFile(const LocalFile&) = delete;
    LocalFile& operator=(const LocalFile&) = delete;

    // Whether the stream opened (and has not been closed since).
    bool isOpen() const { return mode_ == Mode::Write ? writer_ != nullptr : stream_.is_open(); }
    const std::string& path() const { return path_; }
    Mode mode() const { return mode_; }

    // The size in bytes, found by seeking the stream to its end; the stream is left at the start.
    // Nullopt when the stream is closed or cannot seek.
    std::optional<std::uint64_t> size();

    // Puts the stream back at the start. False when it cannot.
    bool rewind();

    // Reads up to `count` bytes; fewer only at the end of the file. Nullopt on a read error.
    std::optional<std::size_t> read(char* buffer, std::size_t count);

    // Writes all `count` bytes. False on a write error.
    bool write(const char* data, std::size_t count);
    // Bytes written so far.
    std::uint64_t written() const { return written_; }

    // Flushes and closes the stream. False when the last bytes could not be written out.
    bool close();

    // CRC-32 (see crc32.h) of the file as it lies on disk, read afresh through its
    // path and independent of the open stream. Nullopt when the file cannot be read.
    std::optional<std::uint32_t> crc32() const;

private:
    std::string path_;
    Mode mode_;
    std::fstream stream_;          // Mode::Read
    std::FILE* writer_ = nullptr;  // Mode::Write
    std::uint64_t written_ = 0;
};

}  // namespace zel
