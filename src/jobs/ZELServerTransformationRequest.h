#pragma once
// The library's job request (see IZELServerTransformationRequest). Made by the session's factories
// (jobs_factories.h); read by the transformation manager.

#include <memory>
#include <string>

#include <zelserverapi/IZELServerTransformationRequest.h>
#include <zelserverapi/IZELServerWorkspace.h>
#include <zelserverapi/ZELServerStringDict.h>

#include "api/heap.h"

namespace zel {

class XmlDocument;

// The workspace path of a workspace named `workspaceName` in `repository`: repository "/" name
// without its last four characters "/" name ("R", "w.ext" gives "R/w/w.ext"). A name shorter than
// four characters loses all of it.
std::string workspacePathOf(const std::string& repository, const std::string& workspaceName);

class ZELServerTransformationRequest final : public IZELServerTransformationRequest, public HeapObject {
public:
    // Workspace `workspace` (a file name) in `repository`.
    ZELServerTransformationRequest(const IZELServerString& keyword, const IZELServerString& repository,
                                   const IZELServerString& workspace);
    // A workspace path taken as given.
    ZELServerTransformationRequest(const IZELServerString& keyword, const IZELServerString& workspacePath);
    // The workspace described by `workspace` (only its name is read) in `repository`.
    ZELServerTransformationRequest(const IZELServerString& keyword, const IZELServerString& repository,
                                   const IZELServerWorkspace& workspace);
    ~ZELServerTransformationRequest() override;

    ZELServerTransformationRequest(const ZELServerTransformationRequest&) = delete;
    ZELServerTransformationRequest& operator=(const ZELServerTransformationRequest&) = delete;

    void setKeyword(const IZELServerString& keyword) override;
    void getKeyword(IZELServerString& out) const override;
    void setPublishedParameter(const IZELServerString& name, const IZELServerString& value) override;
    void setPublishedParameters(const IZELServerStringArray& pairs) override;
    unsigned getPublishedParameter(const IZELServerString& name, IZELServerString& value) const override;
    void getPublishedParameters(IZELServerStringArray& pairs) const override;
    void setDirective(const IZELServerString& name, const IZELServerString& value) override;
    void setDirectives(const IZELServerStringArray& pairs) override;
    unsigned getDirective(const IZELServerString& name, IZELServerString& value) const override;
    void getDirectives(IZELServerStringArray& pairs) const override;
    void setEmbeddedDirective(const IZELServerString& name, const IZELServerString& value) override;
    void setEmbeddedDirectives(const IZELServerStringArray& pairs) override;
    unsigned getEmbeddedDirective(const IZELServerString& name, IZELServerString& value) const override;
    void getEmbeddedDirectives(IZELServerStringArray& pairs) const override;
    void getRequestText(IZELServerString& out) const override;
    void setNotification(const IZELServerString& topic, const IZELServerString& message) override;
    void setNotifications(const IZELServerStringArray& pairs) override;
    unsigned getNotification(const IZELServerString& topic, IZELServerString& message) const override;
    void getNotifications(IZELServerStringArray& pairs) const override;

    const std::string& workspacePath() const { return workspacePath_; }
    // Whether the next getRequestText composes the text again.
    bool dirty() const { return dirty_; }

private:
    ZELServerTransformationRequest(const IZELServerString& keyword, std::string workspacePath);

    // Composes the request text; false, with the text as far as it got and dirty still set, when the
    // XML document cannot be built.
    bool compose() const;
    bool appendElements(const char* tag, const ZELServerStringDict& pairs) const;

    // Composition happens inside the const getter, so what it produces is mutable.
    mutable bool dirty_ = true;
    mutable std::string requestText_;
    std::string workspacePath_;
    std::string keyword_;
    ZELServerStringDict publishedParameters_;
    ZELServerStringDict directives_;
    ZELServerStringDict embeddedDirectives_;
    ZELServerStringDict notifications_;
    mutable std::unique_ptr<XmlDocument> xmlSupport_;
};

}  // namespace zel
