#pragma once
// XmlEntityRefusal: the entity resolver of every reply parser. Replies come from the network, and an
// external entity or DTD could make the parser read local files or open connections on the client's
// behalf, so every request to resolve one is refused by throwing XmlEntityRefused, which ends the
// parse.

#include <stdexcept>

#include <xercesc/util/XMLEntityResolver.hpp>
#include <xercesc/util/XMLResourceIdentifier.hpp>

namespace zel {

class XmlEntityRefused : public std::runtime_error {
public:
    using std::runtime_error::runtime_error;
};

class XmlEntityRefusal : public xercesc::XMLEntityResolver {
public:
    // Never returns: throws XmlEntityRefused naming the refused system identifier.
    xercesc::InputSource* resolveEntity(xercesc::XMLResourceIdentifier* resource) override;
};

}  // namespace zel
