#include "transport/crc32.h"

#include <algorithm>
#include <limits>

#include <zlib.h>

namespace zel {

// zlib's CRC-32 is the same checksum, computed several bytes at a time: the checksum pass of an upload
// runs at memory speed instead of limiting the transfer. zlib's state is the finished value while
// Crc32 keeps the running state of the definition (all ones at the start, complemented for the value;
// see crc32.h), so the state is complemented on the way into zlib and back.
void Crc32::update(const void* data, std::size_t count) noexcept
{
    const auto* bytes = static_cast<const Bytef*>(data);
    uLong crc = ~state_;
    while (count > 0) {
        const auto piece = static_cast<uInt>(std::min<std::size_t>(count, std::numeric_limits<uInt>::max()));
        crc = crc32(crc, bytes, piece);
        bytes += piece;
        count -= piece;
    }
    state_ = ~static_cast<std::uint32_t>(crc);
}

}  // namespace zel
