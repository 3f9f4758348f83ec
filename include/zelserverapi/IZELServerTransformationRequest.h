#pragma once
// One job before it is sent: the service keyword, the path of the workspace on the server, the
// workspace's published parameters, directives (sent beside the request), embedded directives
// (written into the request text) and notifications. Made by one of the session's
// createTransformationRequest forms and destroyed by IZELServerSession::destroyTransformationRequest.
//
// The request text the server runs is the workspace path, " -XML_PARAMETER ", and an XML document
// "TRANSFORMATION_REQUEST" holding one "PUBLISHED_PARAMETER" per published parameter, then one
// "ZEL_DIRECTIVE" per embedded directive.
//
// Pair lists are flat: name, value, name, value; an odd last entry is ignored. Setting a name that is
// already present replaces its value. Pairs are handed out in name order, not in the order they were
// set, and are appended to the caller's list (which is not cleared first). Get-one operations return
// 1 and write the value when the name is present, 0 and leave `value` untouched otherwise.

#include "IZELServerString.h"
#include "IZELServerStringArray.h"

class IZELServerTransformationRequest {
public:
    // The service keyword: the server's configuration subsection that runs the job.
    virtual void setKeyword(const IZELServerString& keyword) = 0;
    virtual void getKeyword(IZELServerString& out) const = 0;

    // Published parameters of the workspace, written into the request text.
    virtual void setPublishedParameter(const IZELServerString& name, const IZELServerString& value) = 0;
    virtual void setPublishedParameters(const IZELServerStringArray& pairs) = 0;
    virtual unsigned getPublishedParameter(const IZELServerString& name, IZELServerString& value) const = 0;
    virtual void getPublishedParameters(IZELServerStringArray& pairs) const = 0;

    // Directives, sent beside the request text as named values (for example "secondsFromNow").
    virtual void setDirective(const IZELServerString& name, const IZELServerString& value) = 0;
    virtual void setDirectives(const IZELServerStringArray& pairs) = 0;
    virtual unsigned getDirective(const IZELServerString& name, IZELServerString& value) const = 0;
    virtual void getDirectives(IZELServerStringArray& pairs) const = 0;

    // Embedded directives, written into the request text as "ZEL_DIRECTIVE" elements. Unlike the
    // keyword and the published parameters, setting them does not make the text be composed again:
    // set them before the first getRequestText, or set the keyword again afterwards.
    virtual void setEmbeddedDirective(const IZELServerString& name, const IZELServerString& value) = 0;
    virtual void setEmbeddedDirectives(const IZELServerStringArray& pairs) = 0;
    virtual unsigned getEmbeddedDirective(const IZELServerString& name, IZELServerString& value) const = 0;
    virtual void getEmbeddedDirectives(IZELServerStringArray& pairs) const = 0;

    // Writes the request text, composing it first when the keyword or a published parameter changed
    // since it was last composed. When the XML document cannot be built, `out` is left untouched and
    // the next call tries again.
    virtual void getRequestText(IZELServerString& out) const = 0;

    // Notifications: topic -> message, sent as one "notificationMsg" value topic ":" message each.
    virtual void setNotification(const IZELServerString& topic, const IZELServerString& message) = 0;
    virtual void setNotifications(const IZELServerStringArray& pairs) = 0;
    virtual unsigned getNotification(const IZELServerString& topic, IZELServerString& message) const = 0;
    virtual void getNotifications(IZELServerStringArray& pairs) const = 0;

    virtual ~IZELServerTransformationRequest() = default;

protected:
    IZELServerTransformationRequest() = default;
    IZELServerTransformationRequest(const IZELServerTransformationRequest&) = default;
    IZELServerTransformationRequest& operator=(const IZELServerTransformationRequest&) = default;
};
