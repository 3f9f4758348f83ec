#pragma once
// One published parameter of a workspace ("PARAMETER"), owned by its IZELServerWorkspace. Read-only;
// missing attributes read as empty text.

#include "IZELServerString.h"
#include "IZELServerStringArray.h"

class IZELServerParameter {
public:
    virtual void getName(IZELServerString& out) const = 0;
    virtual void getDescription(IZELServerString& out) const = 0;
    virtual void getDefaultValue(IZELServerString& out) const = 0;
    // The parameter's type as the server writes it ("param_type").
    virtual void getType(IZELServerString& out) const = 0;
    // Appends the choices the parameter offers: for the options type "FILEFILTER_CONFIG" the whole
    // options text as one entry; for "SINGLECHOICE_CONFIG" and "MULTICHOICE_CONFIG" each piece of the
    // options text between "%" separators, in order; for any other options type nothing.
    virtual void getOptions(IZELServerStringArray& choices) const = 0;
    // The options text as the server wrote it.
    virtual void getOptionsText(IZELServerString& out) const = 0;
    virtual void getOptionsType(IZELServerString& out) const = 0;
    virtual ~IZELServerParameter() = default;

protected:
    IZELServerParameter() = default;
    IZELServerParameter(const IZELServerParameter&) = default;
    IZELServerParameter& operator=(const IZELServerParameter&) = default;
};
