#include "transport/xml_exception.h"

#include <exception>

#include <xercesc/dom/DOMException.hpp>
#include <xercesc/dom/DOMLSException.hpp>
#include <xercesc/sax/SAXException.hpp>
#include <xercesc/util/OutOfMemoryException.hpp>
#include <xercesc/util/XMLException.hpp>

#include "transport/xml_transcode.h"

namespace zel {

std::string currentXmlExceptionMessage()
{
    try {
        throw;
    } catch (const xercesc::OutOfMemoryException&) {
        return "Out of memory";
    } catch (const xercesc::XMLException& e) {
        return toUtf8(e.getMessage());
    } catch (const xercesc::DOMException& e) {  // DOMLSException too
        return toUtf8(e.getMessage());
    } catch (const xercesc::SAXException& e) {
        return toUtf8(e.getMessage());
    } catch (const std::exception& e) {
        return e.what();
    } catch (...) {
        return "Unknown XML library failure";
    }
}

}  // namespace zel
