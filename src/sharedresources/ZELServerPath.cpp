#include "sharedresources/ZELServerPath.h"

#include "api/ZELServerString.h"
#include "transport/attribute_binding.h"

namespace zel {
namespace {

constexpr AttributeBinding<PathFields> kPathAttributes[] = {
    {"name", &PathFields::name},
    {"dirpath", &PathFields::directoryPath},
    {"abspath", &PathFields::absolutePath},
};

}  // namespace

ZELServerPath* ZELServerPath::fromWholePath(std::string_view wholePath)
{
    const std::size_t slash = wholePath.rfind('/');
    if (slash == std::string_view::npos) {
        return fromParts({}, wholePath);
    }
    return fromParts(wholePath.substr(0, slash), wholePath.substr(slash + 1));
}

ZELServerPath* ZELServerPath::fromParts(std::string_view directoryPath, std::string_view name)
{
    auto* path = new ZELServerPath();
    if (path != nullptr) {
        path->fields_.name = name;
        path->fields_.directoryPath = directoryPath;
        path->fields_.absolutePath = joinPath(directoryPath, name);
    }
    return path;
}

std::string ZELServerPath::joinPath(std::string_view directoryPath, std::string_view name)
{
    // Paths are rooted at the resource: a file at its top has the whole path "/name".
    while (!directoryPath.empty() && directoryPath.back() == '/') {
        directoryPath.remove_suffix(1);
    }
    while (!name.empty() && name.front() == '/') {
        name.remove_prefix(1);
    }
    std::string joined(directoryPath);
    joined += '/';
    joined += name;
    return joined;
}

void ZELServerPath::getName(IZELServerString& out) const { handOutText(fields_.name, out); }

void ZELServerPath::getDirectoryPath(IZELServerString& out) const { handOutText(fields_.directoryPath, out); }

void ZELServerPath::getAbsolutePath(IZELServerString& out) const { handOutText(fields_.absolutePath, out); }

void ZELServerPath::readFrom(const XmlElement& element) { readAttributes(element, fields_, kPathAttributes); }

}  // namespace zel
