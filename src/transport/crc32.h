#pragma once
// CRC-32 of IEEE 802.3 (reflected polynomial 0xEDB88320, initial value all ones, final complement):
// the checksum a file header announces, the same one zip archives carry.

#include <cstddef>
#include <cstdint>

namespace zel {

class Crc32 {
public:
    // Adds `count` bytes to the checksum.
    void update(const void* data, std::size_t count) noexcept;

    // The checksum of everything added so far; adding more afterwards goes on from there.
    std::uint32_t value() const noexcept { return ~state_; }

private:
    std::uint32_t state_ = 0xFFFFFFFFu;
};

}  // namespace zel
