// Shared resource areas: named directories that clients reach only through paths relative to
// the area. No path may leave its area: absolute paths, ".." components and symbolic links that
// resolve outside the area are refused before anything touches the file system.
#pragma once

#include <string>
#include <string_view>
#include <vector>

#include "config.h"

namespace zelserverd {

struct AreaPath {
    std::string full;      // file system path inside the area (links in it are not resolved)
    std::string relative;  // the normalised client path, "" for the area itself
};

class SharedArea {
public:
    // Resolves the area directory; `error` is set when it cannot be.
    SharedArea(const SharedResourceConfig& config, std::string& error);

    const SharedResourceConfig& config() const { return config_; }
    // Checks and maps a client path. Empty on success, else why the path is refused.
    std::string resolve(std::string_view clientPath, AreaPath& out) const;

private:
    bool inside(const std::string& realPath) const;

    SharedResourceConfig config_;
    std::string root_;  // canonical
};

// The path named by a "PATH" document: "abspath", or "dirpath" and "name" when it is empty.
std::string pathFromDocument(std::string_view text, std::string& path);

}  // namespace zelserverd
