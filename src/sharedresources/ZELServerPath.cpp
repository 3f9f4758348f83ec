#include "sharedresources/ZELServerPath.h"

#include "transport/xml_element.h"
#include "transport/xml_navigation.h"

namespace zel {
namespace {

void copyOut(const std::string& text, IZELServerString& out)
{
    out.set(text.data(), static_cast<unsigned>(text.size()));
}

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
        path->name_ = name;
        path->directoryPath_ = directoryPath;
        path->absolutePath_ = joinPath(directoryPath, name);
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

void ZELServerPath::getName(IZELServerString& out) const { copyOut(name_, out); }

void ZELServerPath::getDirectoryPath(IZELServerString& out) const { copyOut(directoryPath_, out); }

void ZELServerPath::getAbsolutePath(IZELServerString& out) const { copyOut(absolutePath_, out); }

void ZELServerPath::readFrom(const XmlElement& element)
{
    getAttribute(&element, "name", name_);
    getAttribute(&element, "dirpath", directoryPath_);
    getAttribute(&element, "abspath", absolutePath_);
}

}  // namespace zel
