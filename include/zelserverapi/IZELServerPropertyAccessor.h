#pragma once
// The categorised properties of a service, workspace, dataset or feature type, or the answer of
// IZELServerRepositoryManager::getGlobalItems: category -> property name -> property, both levels in
// name order, names compared exactly. Changes stay local until the owner's updatePropertyAccessor sends
// them. Made by IZELServerSession::createPropertyAccessor and destroyed by
// IZELServerSession::destroyPropertyAccessor; an accessor handed out by its owner belongs to the owner.

#include "IZELServerProperty.h"
#include "IZELServerString.h"
#include "IZELServerStringArray.h"
#include "IZELServerVector.h"

class IZELServerPropertyAccessor {
public:
    // Appends every category name.
    virtual void getCategoryNames(IZELServerStringArray& names) const = 0;
    // Appends the property names of one category (nothing when it is missing).
    virtual void getPropertyNames(const IZELServerString& category, IZELServerStringArray& names) const = 0;
    // Appends name, value, name, value ... for every property of one category. False, and nothing
    // appended, when the category is missing.
    virtual bool getPropertyPairs(const IZELServerString& category, IZELServerStringArray& pairs) const = 0;
    // Empties `value`, then writes the property's value into it. False, `value` left empty, when the
    // category or the name is missing.
    virtual bool getPropertyValue(const IZELServerString& category, const IZELServerString& name,
                                  IZELServerString& value) const = 0;
    // Adds the property (and its category when that is missing), or changes the value of an existing
    // one, keeping its attributes.
    virtual void setProperty(const IZELServerString& category, const IZELServerString& name,
                             const IZELServerString& value) = 0;
    // True when the category existed and was removed with all its properties.
    virtual bool removeCategory(const IZELServerString& category) = 0;
    // True when the property existed and was removed.
    virtual bool removeProperty(const IZELServerString& category, const IZELServerString& name) = 0;
    // Appends a copy of every property of one category; the copies belong to the vector.
    virtual void getProperties(const IZELServerString& category,
                               IZELServerVector<IZELServerProperty>& properties) const = 0;
    // The property itself, owned by this accessor and valid until the accessor changes; null when the
    // category or the name is missing.
    virtual const IZELServerProperty* getProperty(const IZELServerString& category,
                                                  const IZELServerString& name) const = 0;
    virtual ~IZELServerPropertyAccessor() = default;

protected:
    IZELServerPropertyAccessor() = default;
    IZELServerPropertyAccessor(const IZELServerPropertyAccessor&) = default;
    IZELServerPropertyAccessor& operator=(const IZELServerPropertyAccessor&) = default;
};
