#include "repository/ZELServerService.h"

#include <utility>

#include "api/exception_guard.h"
#include "api/ZELServerString.h"
#include "api/message_numbers.h"
#include "transport/attribute_binding.h"
#include "repository/repository_checks.h"
#include "repository/reply_readers.h"
#include "transport/xml_navigation.h"

namespace zel {
namespace {

// The order in which the server writes them and in which the payload writes them back.
constexpr AttributeBinding<ServiceFields> kServiceAttributes[] = {
    {"service_id", &ServiceFields::id},
    {"name", &ServiceFields::name},
    {"display_name", &ServiceFields::displayName},
    {"description", &ServiceFields::description},
    {"url_pattern", &ServiceFields::urlPattern},
    {"is_enabled", &ServiceFields::enabled},
    {"is_workspace_reg_allowed", &ServiceFields::workspaceRegistration},
    {"is_customformat_reg_allowed", &ServiceFields::customFormatRegistration},
    {"is_customtransform_reg_allowed", &ServiceFields::customTransformerRegistration},
    {"is_template_reg_allowed", &ServiceFields::templateRegistration},
};

}  // namespace

ZELServerService::ZELServerService(IZELServerChannel* channel, std::string name, std::string displayName,
                                   std::string description, std::string urlPattern, bool enabled,
                                   bool workspaceRegistration, bool customFormatRegistration,
                                   bool customTransformerRegistration, bool templateRegistration)
    : channel_(channel)
{
    fields_.name = std::move(name);
    fields_.displayName = std::move(displayName);
    fields_.description = std::move(description);
    fields_.urlPattern = std::move(urlPattern);
    fields_.enabled = enabled;
    fields_.workspaceRegistration = workspaceRegistration;
    fields_.customFormatRegistration = customFormatRegistration;
    fields_.customTransformerRegistration = customTransformerRegistration;
    fields_.templateRegistration = templateRegistration;
}

void ZELServerService::getName(IZELServerString& out) const { handOutText(fields_.name, out); }
void ZELServerService::setName(const IZELServerString& name)
{
    guarded([&] { fields_.name = toStdString(name); });
}
void ZELServerService::getDisplayName(IZELServerString& out) const { handOutText(fields_.displayName, out); }
void ZELServerService::setDisplayName(const IZELServerString& displayName)
{
    guarded([&] { fields_.displayName = toStdString(displayName); });
}
void ZELServerService::getDescription(IZELServerString& out) const { handOutText(fields_.description, out); }
void ZELServerService::setDescription(const IZELServerString& description)
{
    guarded([&] { fields_.description = toStdString(description); });
}
void ZELServerService::getUrlPattern(IZELServerString& out) const { handOutText(fields_.urlPattern, out); }
void ZELServerService::setUrlPattern(const IZELServerString& urlPattern)
{
    guarded([&] { fields_.urlPattern = toStdString(urlPattern); });
}

bool ServiceFields::*ZELServerService::registrationField(unsigned itemType)
{
    switch (itemType) {
    case kWorkspaceItemType:
        return &ServiceFields::workspaceRegistration;
    case kCustomFormatItemType:
        return &ServiceFields::customFormatRegistration;
    case kCustomTransformerItemType:
        return &ServiceFields::customTransformerRegistration;
    case kTemplateItemType:
        return &ServiceFields::templateRegistration;
    default:
        return nullptr;
    }
}

unsigned ZELServerService::isRegistrationAllowed(unsigned itemType) const
{
    const auto field = registrationField(itemType);
    return field != nullptr && fields_.*field ? 1 : 0;
}

void ZELServerService::setRegistrationAllowed(unsigned itemType, unsigned allowed)
{
    if (const auto field = registrationField(itemType)) {
        fields_.*field = allowed != 0;
    }
}

IZELServerStatus* ZELServerService::updatePropertyAccessor(const IZELServerPropertyAccessor& accessor)
{
    return guarded([&] {
        const PropertyAccessorXml properties(accessor);
        return CheckedCommand(channel_, "REP_UPDATE_SERVICEPROPERTYACCESSOR")
            .add("serviceID", fields_.id)
            .addXml("propertyAccessorObject", properties, "REP_UPDATE_SERVICEPROPERTYACCESSOR")
            .send();
    });
}

IZELServerStatus* ZELServerService::itemRegistered(const IZELServerString& repositoryName,
                                                   const IZELServerString& itemName, unsigned& registered)
{
    return guarded([&] {
        return CheckedCommand(channel_, "REP_ITEMREGISTERED")
            .add("serviceName", fields_.name)
            .add("repositoryName", repositoryName)
            .add("itemName", itemName)
            .askFlag(registered);
    });
}

IZELServerStatus* ZELServerService::registerItem(const IZELServerString& repositoryName,
                                                 const IZELServerString& itemName)
{
    return guarded([&] {
        // Refused here rather than by the server: an item kind the service does not take, and any name
        // without one of the four endings, never reaches the wire.
        return CheckedCommand(channel_, "REP_REGISTERITEM")
            .require(itemName)
            .check(isRegistrationAllowed(itemTypeOf(toStdString(itemName))) == 1, msg::kRegistrationRefused)
            .add("serviceName", fields_.name)
            .add("repositoryName", repositoryName)
            .add("itemName", itemName)
            .send();
    });
}

IZELServerStatus* ZELServerService::deregisterItem(const IZELServerString& repositoryName,
                                                   const IZELServerString& itemName, unsigned& deregistered)
{
    return guarded([&] {
        return CheckedCommand(channel_, "REP_DEREGISTERITEM")
            .add("serviceName", fields_.name)
            .add("repositoryName", repositoryName)
            .add("itemName", itemName)
            .askFlag(deregistered);
    });
}

IZELServerStatus* ZELServerService::getRegisteredItems(const ZELServerStringDict* directives,
                                                       IZELServerVector<IZELServerItem>& items)
{
    return guarded([&]() -> IZELServerStatus* {
        CheckedCommand command(channel_, "REP_GET_REGISTEREDITEMS");
        command.add("serviceName", fields_.name);
        if (const std::string* itemType = directives != nullptr ? directives->find("ITEM_TYPE") : nullptr) {
            command.add("itemType", *itemType);
        }
        // The response has no item list reader; the items are read from the body here.
        return command.askList([&items](const IZELServerResponse& response) {
            std::string body;
            response.getBody(body);
            return readItemsReply(body, items);
        });
    });
}

bool ZELServerService::readFrom(const XmlElement& element)
{
    readAttributes(element, fields_, kServiceAttributes);
    properties_.clear();
    properties_.readPropertiesOf(element);
    return true;
}

bool ZELServerWorkspaceService::readFrom(const XmlElement& element)
{
    if (const XmlElement* summary = firstElementNamed(&element, "WORKSPACE_SUMMARY")) {
        summary_.readFrom(*summary);
    }
    if (const XmlElement* service = firstElementNamed(&element, "SERVICE")) {
        service_.readFrom(*service);
    }
    return true;
}

}  // namespace zel
