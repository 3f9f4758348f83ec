#pragma once
// An ordered list of strings (duplicates allowed). Many operations read it as a flat pair list:
// name, value, name, value; an odd last entry is ignored there.
// Made by IZELServerSession::createStringArray and destroyed by IZELServerSession::destroyStringArray.

#include "IZELServerString.h"

class IZELServerStringArray {
public:
    // Appends a copy of the value's bytes.
    virtual void append(const IZELServerString& value) = 0;
    // Appends a copy of a NUL-terminated text.
    virtual void append(const char* value) = 0;
    // The text of element `index`; the index must be below entries().
    virtual const char* element(unsigned index) const = 0;
    // Copies element `index` into `out`; the index must be below entries(). Returns 0.
    virtual int getElement(unsigned index, IZELServerString& out) const = 0;
    // Replaces element `index`; the index must be below entries(). Returns 0.
    virtual int setElement(unsigned index, const IZELServerString& value) = 0;
    virtual unsigned entries() const = 0;
    virtual void clear() = 0;
    // True when some element has exactly the value's bytes.
    virtual bool contains(const IZELServerString& value) const = 0;
    virtual bool contains(const char* value) const = 0;
    // Splits `text` at every occurrence of the first character of `delimiter` and appends the pieces.
    virtual void appendTokens(const char* text, const char* delimiter) = 0;
    // Splits `text` at any character of `delimiters`; runs of delimiters give no empty pieces.
    virtual void appendTokensAnyOf(const char* text, const char* delimiters) = 0;
    // Removes every element equal to the value, keeping the order of the rest; returns the count.
    virtual unsigned removeAll(const IZELServerString& value) = 0;
    virtual unsigned removeAll(const char* value) = 0;
    virtual ~IZELServerStringArray() = default;

protected:
    IZELServerStringArray() = default;
    IZELServerStringArray(const IZELServerStringArray&) = default;
    IZELServerStringArray& operator=(const IZELServerStringArray&) = default;
};
