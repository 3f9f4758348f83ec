#pragma once
// A service of the server ("SERVICE") and one registration of a workspace with a service
// ("WORKSPACE_SERVICE"). The service keeps the channel: it registers, checks and deregisters items
// and sends its own properties.

#include <string>

#include <zelserverapi/IZELServerService.h>
#include <zelserverapi/IZELServerWorkspaceService.h>

#include "api/heap.h"
#include "repository/ZELServerPropertyAccessor.h"
#include "repository/repository_objects.h"
#include "transport/IZELServerChannel.h"
#include "transport/payload_fields.h"
#include "transport/xml_document.h"

namespace zel {

struct ServiceFields {
    std::string id = "-1";
    std::string name;
    std::string displayName;
    std::string description;
    std::string urlPattern;
    bool enabled = false;
    bool workspaceRegistration = false;
    bool customFormatRegistration = false;
    bool customTransformerRegistration = false;
    bool templateRegistration = false;
};

class ZELServerService final : public IZELServerService, public ServicePayloadFields, public HeapObject {
public:
    // `channel` is borrowed (null: the commands fail with 393622 once their arguments pass).
    explicit ZELServerService(IZELServerChannel* channel) : channel_(channel) {}
    // The full form: the four texts and the five flags (enabled, then registrations of workspaces,
    // custom formats, custom transformers and templates).
    ZELServerService(IZELServerChannel* channel, std::string name, std::string displayName, std::string description,
                     std::string urlPattern, bool enabled, bool workspaceRegistration, bool customFormatRegistration,
                     bool customTransformerRegistration, bool templateRegistration);
    ZELServerService(const ZELServerService&) = delete;
    ZELServerService& operator=(const ZELServerService&) = delete;
    ~ZELServerService() override = default;

    void getName(IZELServerString& out) const override;
    void setName(const IZELServerString& name) override;
    void getDisplayName(IZELServerString& out) const override;
    void setDisplayName(const IZELServerString& displayName) override;
    void getDescription(IZELServerString& out) const override;
    void setDescription(const IZELServerString& description) override;
    void getUrlPattern(IZELServerString& out) const override;
    void setUrlPattern(const IZELServerString& urlPattern) override;
    unsigned isEnabled() const override { return fields_.enabled ? 1 : 0; }
    void setEnabled(unsigned enabled) override { fields_.enabled = enabled != 0; }
    IZELServerPropertyAccessor& getPropertyAccessor() override { return properties_; }
    IZELServerStatus* updatePropertyAccessor(const IZELServerPropertyAccessor& accessor) override;
    unsigned isWorkspaceRegistrationAllowed() const override { return fields_.workspaceRegistration ? 1 : 0; }
    void setWorkspaceRegistrationAllowed(unsigned allowed) override { fields_.workspaceRegistration = allowed != 0; }
    unsigned isRegistrationAllowed(unsigned itemType) const override;
    void setRegistrationAllowed(unsigned itemType, unsigned allowed) override;
    IZELServerStatus* itemRegistered(const IZELServerString& repositoryName, const IZELServerString& itemName,
                                     unsigned& registered) override;
    IZELServerStatus* registerItem(const IZELServerString& repositoryName, const IZELServerString& itemName) override;
    IZELServerStatus* deregisterItem(const IZELServerString& repositoryName, const IZELServerString& itemName,
                                     unsigned& deregistered) override;
    IZELServerStatus* getRegisteredItems(const ZELServerStringDict* directives,
                                         IZELServerVector<IZELServerItem>& items) override;

    std::string serviceId() const override { return fields_.id; }

    // Binds the service to the channel of the reply it is read from.
    void bindTo(IZELServerChannel* channel) { channel_ = channel; }
    // Replaces the settings and properties from a "SERVICE" element.
    bool readFrom(const XmlElement& element);

private:
    // The flag of an item type; null for a type no service registers.
    static bool ServiceFields::*registrationField(unsigned itemType);

    IZELServerChannel* channel_;
    ServiceFields fields_;
    ZELServerPropertyAccessor properties_;
};

class ZELServerWorkspaceService final : public IZELServerWorkspaceService, public HeapObject {
public:
    explicit ZELServerWorkspaceService(IZELServerChannel* channel) : service_(channel) {}
    ZELServerWorkspaceService(const ZELServerWorkspaceService&) = delete;
    ZELServerWorkspaceService& operator=(const ZELServerWorkspaceService&) = delete;
    ~ZELServerWorkspaceService() override = default;

    const IZELServerWorkspaceSummary& getWorkspaceSummary() const override { return summary_; }
    IZELServerService& getService() override { return service_; }

    void bindTo(IZELServerChannel* channel) { service_.bindTo(channel); }
    // From a "WORKSPACE_SERVICE" element: the first "WORKSPACE_SUMMARY" and the first "SERVICE" inside
    // it; a part the element lacks keeps what it held.
    bool readFrom(const XmlElement& element);

private:
    ZELServerWorkspaceSummary summary_;
    ZELServerService service_;
};

}  // namespace zel
