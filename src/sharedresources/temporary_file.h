#pragma once
// The unique temporary file a download is received into, so that a target file is replaced only by
// a complete transfer. It is deleted when the object goes, unless it was moved onto its target or
// kept. Only the C++ standard library is used, so the same code serves POSIX and Windows.

#include <optional>
#include <string>

namespace zel {

class TemporaryFile {
public:
    // Name pattern: the six X characters are replaced to make the name unique.
    static constexpr const char* kPrefix = "wb-tmp-";
    static constexpr const char* kSuffix = ".tmp";

    // Creates a new empty file "wb-tmp-XXXXXX.tmp" in `directory` (the current directory when empty),
    // never reusing an existing name. Nullopt when no such file can be created there.
    static std::optional<TemporaryFile> createIn(const std::string& directory);

    // The directory a download for `target` is received in: the target's own directory, so that the
    // finished file can be renamed onto it; for an empty target the system's directory for
    // temporary files (the current directory when there is none).
    static std::string directoryFor(const std::string& target);

    TemporaryFile(TemporaryFile&& other) noexcept;
    TemporaryFile& operator=(TemporaryFile&&) = delete;
    TemporaryFile(const TemporaryFile&) = delete;
    TemporaryFile& operator=(const TemporaryFile&) = delete;
    ~TemporaryFile();

    const std::string& path() const { return path_; }

    // Renames the file onto `target`, replacing a file there. True when done; the file is then no
    // longer this object's. On false it stays this object's (and is deleted with it).
    bool moveTo(const std::string& target);
    // Leaves the file where it is when this object goes.
    void keep() { path_.clear(); }

private:
    explicit TemporaryFile(std::string path) : path_(std::move(path)) {}

    std::string path_;  // empty once the file is no longer ours
};

}  // namespace zel
