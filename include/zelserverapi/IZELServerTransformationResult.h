#pragma once
// What the server answers about one job: a text of NUL-separated name "=" value entries, split into
// properties. Made by IZELServerSession::createTransformationResult (empty, or parsed from a text) and
// destroyed by IZELServerSession::destroyTransformationResult; the transformation manager fills it.
//
// Job status codes (getJobStatus), the position of the server's word in this list:
//   0 "SUBMITTED", 1 "QUEUED", 2 "DELAYED", 3 "PAUSED", 4 "IN_PROCESS", 5 "DELETED", 6 "ABORTED",
//   7 "SUCCESS", 8 "ZEL_FAILURE", 9 "JOB_FAILURE", 10 "PULLED".
//
// Getters return a found flag: 1 when the property exists (and converts), else 0, and then leave the
// out argument untouched, with one exception: a number followed by other text gives 0 but has already
// been stored. Numbers are unsigned decimal, or hexadecimal after "0x"; leading spaces, and a point
// followed only by zeros and then spaces, are accepted. Booleans are true for a first letter T, Y, t
// or y, false for F, N, f or n, else true for any non-zero number.
//
// Properties read from the text are kept under their name with a "*" prefix; the "result" property is
// further split into "StatusNumber", "StatusMessage" and its own name=value pieces (kept without the
// prefix). Names given to the getters never carry the prefix: a name is looked up as given, then with
// the prefix.

#include <string>

#include "IZELServerString.h"
#include "IZELServerStringArray.h"

class IZELServerTransformationResult {
public:
    // The whole text as last parsed.
    virtual void getText(IZELServerString& out) const = 0;
    // "result": the service's result text.
    virtual unsigned getResult(IZELServerString& out) const = 0;
    // "id": the job ID.
    virtual unsigned getID(unsigned& id) const = 0;
    // "jobStatus" as a code (see above); 0 also when the word is none of the eleven (exact compare).
    virtual unsigned getJobStatus(unsigned& code) const = 0;
    // 1 when the job status is "SUCCESS", else 0.
    virtual unsigned isSuccess() const = 0;
    // The boolean "resultSuccess"; 0 when missing.
    virtual unsigned getResultSuccess() const = 0;
    virtual unsigned getServiceMessage(IZELServerString& out) const = 0;
    // The boolean "serviceSuccess"; 0 when missing.
    virtual unsigned getServiceSuccess() const = 0;
    // Times as the server wrote them, not interpreted.
    virtual unsigned getTimeRequested(IZELServerString& out) const = 0;
    virtual unsigned getTimeStarted(IZELServerString& out) const = 0;
    virtual unsigned getTimeFinished(IZELServerString& out) const = 0;
    // A leading minus sign is refused.
    virtual unsigned getRequesterResultPort(unsigned& port) const = 0;
    virtual unsigned getRequesterHost(IZELServerString& out) const = 0;
    virtual unsigned getRequest(IZELServerString& out) const = 0;
    virtual unsigned getRequestKeyword(IZELServerString& out) const = 0;
    virtual unsigned getPriority(unsigned& priority) const = 0;
    // 0 also when the description is the text "null"; `out` then holds "null".
    virtual unsigned getDescription(IZELServerString& out) const = 0;
    // Taken from the "number:message" pieces of "result".
    virtual unsigned getStatusNumber(unsigned& number) const = 0;
    virtual unsigned getStatusMessage(IZELServerString& out) const = 0;
    // Appends every property name, without its "*" prefix.
    virtual void getPropertyNames(IZELServerStringArray& names) const = 0;
    // Appends name, value, name, value ... for every property, names without their "*" prefix.
    virtual void getProperties(IZELServerStringArray& pairs) const = 0;
    // Any property by name.
    virtual unsigned getStringProperty(const IZELServerString& name, IZELServerString& value) const = 0;
    virtual unsigned getFloatProperty(const IZELServerString& name, float& value) const = 0;
    virtual unsigned getUIntProperty(const IZELServerString& name, unsigned& value) const = 0;
    virtual unsigned getBoolProperty(const IZELServerString& name, unsigned& value) const = 0;
    virtual ~IZELServerTransformationResult() = default;

    // The operations below follow the destructor in the table and keep that place. The library uses
    // them while it fills a result; they take standard strings, which the caller and the library
    // compile from this one declaration.

    // Same as findProperty.
    virtual unsigned lookupProperty(const std::string& name, std::string& value) const = 0;
    virtual unsigned getStringProperty(const std::string& name, IZELServerString& value) const = 0;
    virtual unsigned getFloatProperty(const std::string& name, float& value) const = 0;
    // As getUIntProperty, but a leading minus sign is refused.
    virtual unsigned getUIntPropertyAnyBase(const std::string& name, unsigned& value) const = 0;
    virtual unsigned getUIntProperty(const std::string& name, unsigned& value) const = 0;
    virtual unsigned getBoolProperty(const std::string& name, unsigned& value) const = 0;
    // Stores the text, then runs parseProperties and parseResultValue. Parsing again adds to and
    // overwrites the properties but never removes one; an empty text changes nothing.
    virtual void parse(const IZELServerString& text) = 0;
    // Splits the stored text at NULs and stores each name=value entry as "*" name; entries without
    // "=" are skipped.
    virtual void parseProperties() = 0;
    // Splits "result" at "|" into "StatusNumber", "StatusMessage" and its name=value pieces.
    virtual void parseResultValue() = 0;
    // Looks `name` up as given, then with the "*" prefix; 1 and `value` written when found.
    virtual unsigned findProperty(const std::string& name, std::string& value) const = 0;

protected:
    IZELServerTransformationResult() = default;
    IZELServerTransformationResult(const IZELServerTransformationResult&) = default;
    IZELServerTransformationResult& operator=(const IZELServerTransformationResult&) = default;
};
