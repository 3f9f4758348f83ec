#pragma once
// One attribute of a feature type ("ATTRIBUTE"), owned by its IZELServerFeatureType. Read-only;
// missing attributes read as empty text or 0.

#include "IZELServerString.h"

class IZELServerAttribute {
public:
    virtual void getName(IZELServerString& out) const = 0;
    // The attribute's type name as the server writes it ("zel_type").
    virtual void getType(IZELServerString& out) const = 0;
    virtual int getDecimals() const = 0;
    virtual int getWidth() const = 0;
    virtual ~IZELServerAttribute() = default;

protected:
    IZELServerAttribute() = default;
    IZELServerAttribute(const IZELServerAttribute&) = default;
    IZELServerAttribute& operator=(const IZELServerAttribute&) = default;
};
