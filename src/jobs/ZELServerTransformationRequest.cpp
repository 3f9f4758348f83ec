#include "jobs/ZELServerTransformationRequest.h"

#include <algorithm>
#include <utility>

#include "api/exception_guard.h"
#include "api/StringDict.h"
#include "api/ZELServerString.h"
#include "api/text_encoding.h"
#include "transport/xml_document.h"

namespace zel {
namespace {

// The length of a three-letter extension with its point; the server stores a workspace in a folder
// named after it without that extension.
constexpr std::size_t kExtensionLength = 4;

void setOne(ZELServerStringDict& dict, const IZELServerString& name, const IZELServerString& value)
{
    dict.insert(toStdString(name), toStdString(value));
}

unsigned getOne(const ZELServerStringDict& dict, const IZELServerString& name, IZELServerString& value)
{
    const std::string* found = dict.find(toStdString(name));
    if (found == nullptr) {
        return 0;
    }
    copyText(*found, value);
    return 1;
}

// Texts that are not UTF-8 are taken to be in the local code page, as the channel takes the request
// text itself; the XML layer accepts UTF-8 only.
std::string asUtf8(const std::string& text) { return isValidUtf8(text) ? text : latin1ToUtf8(text); }

std::string workspaceName(const IZELServerWorkspace& workspace)
{
    ZELServerString name;
    workspace.getName(name);
    return name.str();
}

}  // namespace

std::string workspacePathOf(const std::string& repository, const std::string& workspaceName)
{
    // Four characters go whatever the name ends with; a shorter name leaves an empty folder name
    // rather than a read before its start.
    const std::size_t kept = workspaceName.size() - std::min(workspaceName.size(), kExtensionLength);
    return repository + "/" + workspaceName.substr(0, kept) + "/" + workspaceName;
}

ZELServerTransformationRequest::ZELServerTransformationRequest(const IZELServerString& keyword,
                                                               std::string workspacePath)
    : workspacePath_(std::move(workspacePath)), keyword_(toStdString(keyword))
{}

ZELServerTransformationRequest::ZELServerTransformationRequest(const IZELServerString& keyword,
                                                               const IZELServerString& repository,
                                                               const IZELServerString& workspace)
    : ZELServerTransformationRequest(keyword, workspacePathOf(toStdString(repository), toStdString(workspace)))
{}

ZELServerTransformationRequest::ZELServerTransformationRequest(const IZELServerString& keyword,
                                                               const IZELServerString& workspacePath)
    : ZELServerTransformationRequest(keyword, toStdString(workspacePath))
{}

ZELServerTransformationRequest::ZELServerTransformationRequest(const IZELServerString& keyword,
                                                               const IZELServerString& repository,
                                                               const IZELServerWorkspace& workspace)
    : ZELServerTransformationRequest(keyword, workspacePathOf(toStdString(repository), workspaceName(workspace)))
{}

ZELServerTransformationRequest::~ZELServerTransformationRequest() = default;

// ---- Keyword and pair lists -----------------------------------------------------------------------

void ZELServerTransformationRequest::setKeyword(const IZELServerString& keyword)
{
    guarded([&] {
        keyword_ = toStdString(keyword);
        dirty_ = true;
    });
}

void ZELServerTransformationRequest::getKeyword(IZELServerString& out) const { handOutText(keyword_, out); }

void ZELServerTransformationRequest::setPublishedParameter(const IZELServerString& name, const IZELServerString& value)
{
    guarded([&] {
        setOne(publishedParameters_, name, value);
        dirty_ = true;
    });
}

void ZELServerTransformationRequest::setPublishedParameters(const IZELServerStringArray& pairs)
{
    guarded([&] {
        insertPairs(pairs, publishedParameters_);
        dirty_ = true;
    });
}

unsigned ZELServerTransformationRequest::getPublishedParameter(const IZELServerString& name,
                                                               IZELServerString& value) const
{
    return guarded([&] { return getOne(publishedParameters_, name, value); });
}

void ZELServerTransformationRequest::getPublishedParameters(IZELServerStringArray& pairs) const
{
    guarded([&] { appendPairs(publishedParameters_, pairs); });
}

void ZELServerTransformationRequest::setDirective(const IZELServerString& name, const IZELServerString& value)
{
    guarded([&] { setOne(directives_, name, value); });
}

void ZELServerTransformationRequest::setDirectives(const IZELServerStringArray& pairs)
{
    guarded([&] { insertPairs(pairs, directives_); });
}

unsigned ZELServerTransformationRequest::getDirective(const IZELServerString& name, IZELServerString& value) const
{
    return guarded([&] { return getOne(directives_, name, value); });
}

void ZELServerTransformationRequest::getDirectives(IZELServerStringArray& pairs) const
{
    guarded([&] { appendPairs(directives_, pairs); });
}

// Embedded directives belong to the request text, yet setting them leaves the composed text alone:
// callers rely on setting the keyword again to have them written, so dirty is deliberately kept.
void ZELServerTransformationRequest::setEmbeddedDirective(const IZELServerString& name, const IZELServerString& value)
{
    guarded([&] { setOne(embeddedDirectives_, name, value); });
}

void ZELServerTransformationRequest::setEmbeddedDirectives(const IZELServerStringArray& pairs)
{
    guarded([&] { insertPairs(pairs, embeddedDirectives_); });
}

unsigned ZELServerTransformationRequest::getEmbeddedDirective(const IZELServerString& name,
                                                              IZELServerString& value) const
{
    return guarded([&] { return getOne(embeddedDirectives_, name, value); });
}

void ZELServerTransformationRequest::getEmbeddedDirectives(IZELServerStringArray& pairs) const
{
    guarded([&] { appendPairs(embeddedDirectives_, pairs); });
}

void ZELServerTransformationRequest::setNotification(const IZELServerString& topic, const IZELServerString& message)
{
    guarded([&] { setOne(notifications_, topic, message); });
}

void ZELServerTransformationRequest::setNotifications(const IZELServerStringArray& pairs)
{
    guarded([&] { insertPairs(pairs, notifications_); });
}

unsigned ZELServerTransformationRequest::getNotification(const IZELServerString& topic, IZELServerString& message) const
{
    return guarded([&] { return getOne(notifications_, topic, message); });
}

void ZELServerTransformationRequest::getNotifications(IZELServerStringArray& pairs) const
{
    guarded([&] { appendPairs(notifications_, pairs); });
}

// ---- Request text ---------------------------------------------------------------------------------

void ZELServerTransformationRequest::getRequestText(IZELServerString& out) const
{
    guarded([&] {
        if (dirty_ && !compose()) {
            return;
        }
        copyText(requestText_, out);
    });
}

bool ZELServerTransformationRequest::compose() const
{
    requestText_ = workspacePath_ + " -XML_PARAMETER ";
    if (!xmlSupport_) {
        std::unique_ptr<XmlDocument> support(new XmlDocument());
        if (!support) {
            return false;
        }
        std::unique_ptr<IZELServerStatus> failure(support->startXml());
        if (failure) {
            return false;
        }
        xmlSupport_ = std::move(support);
    }
    XmlDocument& document = *xmlSupport_;
    if (document.createDocument("", "TRANSFORMATION_REQUEST") == nullptr) {
        return false;
    }
    std::string serialised;
    const bool built = appendElements("PUBLISHED_PARAMETER", publishedParameters_) &&
                       appendElements("ZEL_DIRECTIVE", embeddedDirectives_);
    std::unique_ptr<IZELServerStatus> failure(built ? document.serialize(serialised) : nullptr);
    document.releaseDocument();
    if (!built || failure) {
        return false;
    }
    requestText_ += serialised;
    dirty_ = false;
    return true;
}

bool ZELServerTransformationRequest::appendElements(const char* tag, const ZELServerStringDict& pairs) const
{
    XmlDocument& document = *xmlSupport_;
    XmlElement* root = document.documentElement();
    for (const auto& [name, value] : pairs) {
        XmlElement* element = document.createElement(tag);
        if (element == nullptr || !element->setAttribute("name", asUtf8(name)) || !element->appendText(asUtf8(value)) ||
            !root->appendChild(element)) {
            return false;
        }
    }
    return true;
}

}  // namespace zel
