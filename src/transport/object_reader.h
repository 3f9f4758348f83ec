#pragma once
// The one way a reply body becomes library objects. Every object reader of the response is one of
// the three templates below plus the object kind's own fill function; none of them parses, looks
// for elements or maps failures by itself.
//
// Results, shared by all three: 0 when the objects were read; the parser's message number (393620)
// when the body is not a well-formed document (an empty body included); 393621 when there is no
// document element or the kind's reader refuses what it finds. The body is parsed with the hardened
// reader (xml_reader.h) and lives only during the call, as do the elements handed to the callables.

#include <memory>
#include <string_view>
#include <type_traits>

#include <zelserverapi/IZELServerVector.h>

#include "api/ZELServerVector.h"
#include "api/message_numbers.h"
#include "transport/xml_document.h"
#include "transport/xml_navigation.h"
#include "transport/xml_reader.h"

namespace zel {

// Parses `body` into `reader`: 0, or the message number of the parser's status (which is released).
int parseReplyBody(XmlReader& reader, std::string_view body);

// Hands the document element of `body` to `read`, a callable (const XmlElement&) -> bool that
// returns false when the document is not what it expects.
template <class Read>
int readReplyDocument(std::string_view body, Read&& read)
{
    XmlReader reader;
    if (const int code = parseReplyBody(reader, body); code != 0) {
        return code;
    }
    const XmlElement* root = reader.rootOf();
    if (root == nullptr || !read(*root)) {
        return static_cast<int>(msg::kUnreadableReply);
    }
    return 0;
}

// Fills `object` from the first element named `tag` (exactly) anywhere in the document, the
// document element included. `Concrete` is the library's class behind `Interface`; an object of
// any other class is refused like a document without the element (393621). `fill` is a callable
// (Concrete&, const XmlElement&) -> bool.
template <class Concrete, class Interface, class Fill>
int readFirstObject(std::string_view body, std::string_view tag, Interface& object, Fill&& fill)
{
    return readReplyDocument(body, [&](const XmlElement& root) {
        Concrete* concrete = dynamic_cast<Concrete*>(&object);
        const XmlElement* element = firstElementNamed(&root, tag);
        return concrete != nullptr && element != nullptr && fill(*concrete, *element);
    });
}

// Empties `out` (destroying what it held, since it owns its elements), then for every element named
// `tag` anywhere in the document, in document order, makes an object with `make` (a callable
// returning a new Concrete*, null when memory is exhausted), fills it with `fill` and appends it.
// A document without such elements leaves `out` empty and succeeds. When an object cannot be made
// or filled, it is destroyed and the reading stops with 393621; the objects appended before stay.
// A body that does not parse leaves `out` untouched.
template <class Interface, class Make, class Fill>
int readObjectList(std::string_view body, std::string_view tag, IZELServerVector<Interface>& out, Make&& make,
                   Fill&& fill)
{
    using Concrete = std::remove_pointer_t<decltype(make())>;
    static_assert(std::is_base_of_v<Interface, Concrete>, "the made objects must implement the element interface");
    return readReplyDocument(body, [&](const XmlElement& root) {
        out.clearAndDestroy();
        for (const XmlElement* element : elementsNamed(&root, tag)) {
            std::unique_ptr<Concrete> object(make());
            if (object == nullptr || !fill(*object, *element)) {
                return false;
            }
            appendOrThrow<Interface>(out, object.release());
        }
        return true;
    });
}

}  // namespace zel
