#pragma once
// The library's job result (see IZELServerTransformationResult): the text last parsed and the
// properties read from it (result_text.h). Made by the session's factories (jobs_factories.h) and
// filled by the transformation manager.

#include <string>

#include <zelserverapi/IZELServerTransformationResult.h>

#include "api/heap.h"
#include "jobs/result_text.h"

namespace zel {

class ZELServerTransformationResult final : public IZELServerTransformationResult, public HeapObject {
public:
    ZELServerTransformationResult() = default;
    ~ZELServerTransformationResult() override = default;
    ZELServerTransformationResult(const ZELServerTransformationResult&) = delete;
    ZELServerTransformationResult& operator=(const ZELServerTransformationResult&) = delete;

    void getText(IZELServerString& out) const override;
    unsigned getResult(IZELServerString& out) const override;
    unsigned getID(unsigned& id) const override;
    unsigned getJobStatus(unsigned& code) const override;
    unsigned isSuccess() const override;
    unsigned getResultSuccess() const override;
    unsigned getServiceMessage(IZELServerString& out) const override;
    unsigned getServiceSuccess() const override;
    unsigned getTimeRequested(IZELServerString& out) const override;
    unsigned getTimeStarted(IZELServerString& out) const override;
    unsigned getTimeFinished(IZELServerString& out) const override;
    unsigned getRequesterResultPort(unsigned& port) const override;
    unsigned getRequesterHost(IZELServerString& out) const override;
    unsigned getRequest(IZELServerString& out) const override;
    unsigned getRequestKeyword(IZELServerString& out) const override;
    unsigned getPriority(unsigned& priority) const override;
    unsigned getDescription(IZELServerString& out) const override;
    unsigned getStatusNumber(unsigned& number) const override;
    unsigned getStatusMessage(IZELServerString& out) const override;
    void getPropertyNames(IZELServerStringArray& names) const override;
    void getProperties(IZELServerStringArray& pairs) const override;
    unsigned getStringProperty(const IZELServerString& name, IZELServerString& value) const override;
    unsigned getFloatProperty(const IZELServerString& name, float& value) const override;
    unsigned getUIntProperty(const IZELServerString& name, unsigned& value) const override;
    unsigned getBoolProperty(const IZELServerString& name, unsigned& value) const override;

    unsigned lookupProperty(const std::string& name, std::string& value) const override;
    unsigned getStringProperty(const std::string& name, IZELServerString& value) const override;
    unsigned getFloatProperty(const std::string& name, float& value) const override;
    unsigned getUIntPropertyAnyBase(const std::string& name, unsigned& value) const override;
    unsigned getUIntProperty(const std::string& name, unsigned& value) const override;
    unsigned getBoolProperty(const std::string& name, unsigned& value) const override;
    void parse(const IZELServerString& text) override;
    void parseProperties() override;
    void parseResultValue() override;
    unsigned findProperty(const std::string& name, std::string& value) const override;

    const ResultProperties& properties() const { return properties_; }

private:
    std::string text_;
    ResultProperties properties_;
};

}  // namespace zel
