#include "transport/crc32.h"

#include <array>

namespace zel {
namespace {

using Table = std::array<std::uint32_t, 256>;

// One entry per byte value: the remainder of that byte shifted through the reflected polynomial.
Table makeTable() noexcept
{
    Table table{};
    for (std::uint32_t byte = 0; byte < table.size(); ++byte) {
        std::uint32_t remainder = byte;
        for (int bit = 0; bit < 8; ++bit) {
            remainder = (remainder & 1u) != 0 ? (remainder >> 1) ^ 0xEDB88320u : remainder >> 1;
        }
        table[byte] = remainder;
    }
    return table;
}

// Built once, on first use, by whichever thread gets there first.
const Table& table() noexcept
{
    static const Table instance = makeTable();
    return instance;
}

}  // namespace

void Crc32::update(const void* data, std::size_t count) noexcept
{
    const Table& entries = table();
    const auto* bytes = static_cast<const unsigned char*>(data);
    std::uint32_t state = state_;
    for (std::size_t i = 0; i < count; ++i) {
        state = entries[(state ^ bytes[i]) & 0xFFu] ^ (state >> 8);
    }
    state_ = state;
}

}  // namespace zel
