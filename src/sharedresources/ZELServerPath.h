#pragma once
// A path inside a shared resource ("PATH"): name, directory path and absolute path, kept as text.

#include <string>
#include <string_view>

#include <zelserverapi/IZELServerPath.h>
#include <zelserverapi/IZELServerString.h>

#include "api/heap.h"

namespace zel {

class XmlElement;

struct PathFields {
    std::string name;
    std::string directoryPath;
    std::string absolutePath;
};

class ZELServerPath final : public IZELServerPath, public HeapObject {
public:
    // All three texts empty.
    ZELServerPath() = default;
    ~ZELServerPath() override = default;
    ZELServerPath(const ZELServerPath&) = delete;
    ZELServerPath& operator=(const ZELServerPath&) = delete;

    // From a whole path: the name is the text behind the last "/", the directory path the text
    // before it (empty when there is no "/"), and the absolute path is joinPath() of the two.
    static ZELServerPath* fromWholePath(std::string_view wholePath);
    // From a directory path and a name, both kept as given; the absolute path is joinPath() of them.
    static ZELServerPath* fromParts(std::string_view directoryPath, std::string_view name);

    // The directory path and the name with exactly one "/" between them: a "/" that the directory
    // ends with or the name starts with is not doubled. An empty directory path (the resource itself)
    // gives "/name".
    static std::string joinPath(std::string_view directoryPath, std::string_view name);

    void getName(IZELServerString& out) const override;
    void getDirectoryPath(IZELServerString& out) const override;
    void getAbsolutePath(IZELServerString& out) const override;

    // Replaces the three texts with the attributes "name", "dirpath" and "abspath" of `element`
    // (absent ones read as empty), taken as the server wrote them.
    void readFrom(const XmlElement& element);

private:
    PathFields fields_;
};

}  // namespace zel
