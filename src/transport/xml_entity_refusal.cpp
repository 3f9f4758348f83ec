#include "transport/xml_entity_refusal.h"

#include <string>

#include "transport/xml_transcode.h"

namespace zel {

xercesc::InputSource* XmlEntityRefusal::resolveEntity(xercesc::XMLResourceIdentifier* resource)
{
    std::string what = "External entities are not allowed";
    if (resource != nullptr && resource->getSystemId() != nullptr) {
        what += ": " + toUtf8(resource->getSystemId());
    }
    throw XmlEntityRefused(what);
}

}  // namespace zel
