#include "jobs/ZELServerTransformationResult.h"

#include <cstdint>
#include <optional>

#include "api/exception_guard.h"
#include "api/ZELServerString.h"
#include "api/conversions.h"

namespace zel {
namespace {

// The well-known properties all come from the text itself, so they carry its prefix.
std::string fromText(const char* name) { return std::string(1, kResultPropertyPrefix) + name; }

std::string withoutPrefix(const std::string& key)
{
    const std::size_t start = key.find_first_not_of(kResultPropertyPrefix);
    return start == std::string::npos ? std::string() : key.substr(start);
}

// 1 with the converted property in `value`; 0, leaving `value` alone, when the property is missing or
// does not convert.
template <class Value, class Convert>
unsigned convertProperty(const ZELServerTransformationResult& result, const std::string& name, Convert convert,
                         Value& value)
{
    std::string found;
    if (!result.findProperty(name, found)) {
        return 0;
    }
    const auto converted = convert(found);
    if (!converted) {
        return 0;
    }
    value = *converted;
    return 1;
}

}  // namespace

// ---- Typed getters of the well-known properties ---------------------------------------------------

void ZELServerTransformationResult::getText(IZELServerString& out) const { handOutText(text_, out); }

unsigned ZELServerTransformationResult::getResult(IZELServerString& out) const
{
    return guarded([&] { return getStringProperty(fromText("result"), out); });
}

unsigned ZELServerTransformationResult::getID(unsigned& id) const
{
    return guarded([&] { return getUIntProperty(fromText("id"), id); });
}

unsigned ZELServerTransformationResult::getJobStatus(unsigned& code) const
{
    return guarded([&] { return convertProperty(*this, fromText("jobStatus"), jobStatusCode, code); });
}

unsigned ZELServerTransformationResult::isSuccess() const
{
    unsigned code = 0;
    return getJobStatus(code) != 0 && code == kJobStatusSuccess ? 1 : 0;
}

unsigned ZELServerTransformationResult::getResultSuccess() const
{
    return guarded([&] {
        unsigned flag = 0;
        return getBoolProperty(fromText("resultSuccess"), flag) != 0 ? flag : 0;
    });
}

unsigned ZELServerTransformationResult::getServiceMessage(IZELServerString& out) const
{
    return guarded([&] { return getStringProperty(fromText("serviceMsg"), out); });
}

unsigned ZELServerTransformationResult::getServiceSuccess() const
{
    return guarded([&] {
        unsigned flag = 0;
        return getBoolProperty(fromText("serviceSuccess"), flag) != 0 ? flag : 0;
    });
}

unsigned ZELServerTransformationResult::getTimeRequested(IZELServerString& out) const
{
    return guarded([&] { return getStringProperty(fromText("timeRequested"), out); });
}

unsigned ZELServerTransformationResult::getTimeStarted(IZELServerString& out) const
{
    return guarded([&] { return getStringProperty(fromText("timeStarted"), out); });
}

unsigned ZELServerTransformationResult::getTimeFinished(IZELServerString& out) const
{
    return guarded([&] { return getStringProperty(fromText("timeFinished"), out); });
}

unsigned ZELServerTransformationResult::getRequesterResultPort(unsigned& port) const
{
    return guarded([&] { return getUIntPropertyAnyBase(fromText("requesterResultPort"), port); });
}

unsigned ZELServerTransformationResult::getRequesterHost(IZELServerString& out) const
{
    return guarded([&] { return getStringProperty(fromText("requesterHost"), out); });
}

unsigned ZELServerTransformationResult::getRequest(IZELServerString& out) const
{
    return guarded([&] { return getStringProperty(fromText("request"), out); });
}

unsigned ZELServerTransformationResult::getRequestKeyword(IZELServerString& out) const
{
    return guarded([&] { return getStringProperty(fromText("requestKeyword"), out); });
}

unsigned ZELServerTransformationResult::getPriority(unsigned& priority) const
{
    return guarded([&] { return getUIntProperty(fromText("priority"), priority); });
}

unsigned ZELServerTransformationResult::getDescription(IZELServerString& out) const
{
    return guarded([&]() -> unsigned {
        // The server writes "null" for a job that was given no description; the text is still handed
        // out, but it does not count as one.
        if (!getStringProperty(fromText("description"), out)) {
            return 0;
        }
        return out.equals("null") ? 0 : 1;
    });
}

unsigned ZELServerTransformationResult::getStatusNumber(unsigned& number) const
{
    return guarded([&] { return getUIntProperty(std::string("StatusNumber"), number); });
}

unsigned ZELServerTransformationResult::getStatusMessage(IZELServerString& out) const
{
    return guarded([&] { return getStringProperty(std::string("StatusMessage"), out); });
}

// ---- All properties -------------------------------------------------------------------------------

void ZELServerTransformationResult::getPropertyNames(IZELServerStringArray& names) const
{
    guarded([&] {
        for (const auto& [key, value] : properties_) {
            names.append(ZELServerString(withoutPrefix(key)));
        }
    });
}

void ZELServerTransformationResult::getProperties(IZELServerStringArray& pairs) const
{
    guarded([&] {
        for (const auto& [key, value] : properties_) {
            pairs.append(ZELServerString(withoutPrefix(key)));
            pairs.append(ZELServerString(value));
        }
    });
}

// ---- Generic getters ------------------------------------------------------------------------------

unsigned ZELServerTransformationResult::getStringProperty(const IZELServerString& name, IZELServerString& value) const
{
    return guarded([&] { return getStringProperty(toStdString(name), value); });
}

unsigned ZELServerTransformationResult::getFloatProperty(const IZELServerString& name, float& value) const
{
    return guarded([&] { return getFloatProperty(toStdString(name), value); });
}

unsigned ZELServerTransformationResult::getUIntProperty(const IZELServerString& name, unsigned& value) const
{
    return guarded([&] { return getUIntProperty(toStdString(name), value); });
}

unsigned ZELServerTransformationResult::getBoolProperty(const IZELServerString& name, unsigned& value) const
{
    return guarded([&] { return getBoolProperty(toStdString(name), value); });
}

unsigned ZELServerTransformationResult::lookupProperty(const std::string& name, std::string& value) const
{
    return findProperty(name, value);
}

unsigned ZELServerTransformationResult::getStringProperty(const std::string& name, IZELServerString& value) const
{
    return guarded([&]() -> unsigned {
        std::string found;
        if (!findProperty(name, found)) {
            return 0;
        }
        copyText(found, value);
        return 1;
    });
}

unsigned ZELServerTransformationResult::getFloatProperty(const std::string& name, float& value) const
{
    return guarded([&] { return convertProperty(*this, name, toFloat, value); });
}

unsigned ZELServerTransformationResult::getUIntPropertyAnyBase(const std::string& name, unsigned& value) const
{
    return guarded([&]() -> unsigned {
        std::string found;
        if (!findProperty(name, found)) {
            return 0;
        }
        // Like storeUInt32: a number followed by other text is stored and still reported as not found.
        const NumberReading<std::uint32_t> reading = readUInt32AnyBase(found);
        if (reading.read) {
            value = reading.value;
        }
        return reading.complete ? 1 : 0;
    });
}

unsigned ZELServerTransformationResult::getUIntProperty(const std::string& name, unsigned& value) const
{
    return guarded([&]() -> unsigned {
        std::string found;
        if (!findProperty(name, found)) {
            return 0;
        }
        std::uint32_t number = value;
        const bool complete = storeUInt32(found, number);
        value = number;
        return complete ? 1 : 0;
    });
}

unsigned ZELServerTransformationResult::getBoolProperty(const std::string& name, unsigned& value) const
{
    return guarded([&] { return convertProperty(*this, name, toBoolean, value); });
}

unsigned ZELServerTransformationResult::findProperty(const std::string& name, std::string& value) const
{
    return guarded([&]() -> unsigned {
        auto it = properties_.find(name);
        if (it == properties_.end()) {
            it = properties_.find(std::string(1, kResultPropertyPrefix) + name);
        }
        if (it == properties_.end()) {
            return 0;
        }
        value = it->second;
        return 1;
    });
}

// ---- Parsing --------------------------------------------------------------------------------------

void ZELServerTransformationResult::parse(const IZELServerString& text)
{
    guarded([&] {
        text_ = toStdString(text);
        parseProperties();
        parseResultValue();
    });
}

void ZELServerTransformationResult::parseProperties()
{
    guarded([&] { parseResultEntries(text_, properties_); });
}

void ZELServerTransformationResult::parseResultValue()
{
    guarded([&] { splitResultValue(properties_); });
}

}  // namespace zel
