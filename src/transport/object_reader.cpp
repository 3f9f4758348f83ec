#include "transport/object_reader.h"

namespace zel {

int parseReplyBody(XmlReader& reader, std::string_view body)
{
    IZELServerStatus* failure = reader.parse(body);
    if (failure == nullptr) {
        return 0;
    }
    const unsigned code = failure->getMessageNumber();
    delete failure;
    return static_cast<int>(code);
}

}  // namespace zel
