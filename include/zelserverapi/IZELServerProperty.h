#pragma once
// One categorised property ("PROPERTY") of a service, workspace, dataset or feature type: a category,
// a name, a value and named attributes. A property handed out by IZELServerPropertyAccessor::getProperty
// belongs to the accessor; those appended by IZELServerPropertyAccessor::getProperties are copies that
// belong to the vector (IZELServerSession::createPropertyVector). Read-only: change values through
// the accessor.

#include "IZELServerString.h"
#include "IZELServerStringArray.h"

class IZELServerProperty {
public:
    virtual void getCategory(IZELServerString& out) const = 0;
    virtual void getName(IZELServerString& out) const = 0;
    // The value as text (it may hold any characters).
    virtual void getValue(IZELServerString& out) const = 0;
    // True and the value written when the property has the attribute (exact name); false and `value`
    // untouched otherwise.
    virtual bool getAttribute(const IZELServerString& name, IZELServerString& value) const = 0;
    // Appends name, value, name, value ... for every attribute, in name order.
    virtual void getAttributes(IZELServerStringArray& pairs) const = 0;
    virtual ~IZELServerProperty() = default;

protected:
    IZELServerProperty() = default;
    IZELServerProperty(const IZELServerProperty&) = default;
    IZELServerProperty& operator=(const IZELServerProperty&) = default;
};
