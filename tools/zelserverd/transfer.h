// File transfers alongside a command, from the server's side:
//   upload:   C request; S ack; C file header; S ack; C raw content; S reply
//   download: C request; S file header; C ack; S raw content; C ack; S reply
// Received content always lands in a temporary file in the server's own folder for them and is
// renamed into place only when complete and checked, so a failed or abandoned upload leaves
// nothing behind among anyone's files.
#pragma once

#include <cstdint>
#include <string>

#include "net.h"

namespace zelserverd {

// A temporary file that is deleted unless commit() renamed it into place.
class TempFile {
public:
    TempFile() = default;
    TempFile(TempFile&& other) noexcept;
    TempFile& operator=(TempFile&& other) noexcept;
    TempFile(const TempFile&) = delete;
    TempFile& operator=(const TempFile&) = delete;
    ~TempFile();

    // Creates a uniquely named file in `dir`. Empty on success, else the reason.
    std::string create(const std::string& dir);
    int fd() const { return fd_.get(); }
    const std::string& path() const { return path_; }
    // Flushes to disk and renames onto `destination`, replacing what is there.
    std::string commit(const std::string& destination);
    void discard();

private:
    bool copyInto(const std::string& destination);

    UniqueFd fd_;
    std::string path_;
};

// Names of temporary files start with this.
constexpr std::string_view kTempPrefix = ".zelserverd-";

enum class TransferOutcome { Ok, Refused, Lost };

struct UploadResult {
    TransferOutcome outcome = TransferOutcome::Lost;
    std::string message;  // why it was refused
    TempFile file;
    std::uint64_t length = 0;
};

// Runs the server's half of an upload into a temporary file in `dir`. Refused: the reply (an
// ERROR with `message`) is still owed to the client. Lost: the connection is out of step or
// gone and must be closed.
UploadResult receiveUpload(FrameIo& io, const std::string& dir, bool checkCrc, std::uint64_t maxBytes);

// Runs the server's half of a download of the open file `fd` (read from its start). Refused
// means nothing was sent yet; Lost means the connection must be closed.
TransferOutcome sendDownload(FrameIo& io, int fd, std::string& message);

}  // namespace zelserverd
