// Slot positions of the public interfaces' overloads. A client calls every operation through its
// position in the virtual table, so an overload moved next to its namesake in a header breaks clients
// that still compile without a murmur. Positions are read from pointers to member functions, whose
// bytes the Itanium C++ ABI defines (x86): the byte offset of the table entry plus one. A virtual
// destructor takes two entries, so every slot behind it sits one entry further on.

#include <gtest/gtest.h>

#include <zelserverapi/interfaces.h>

#include <cstddef>
#include <cstring>
#include <string>

#if defined(_MSC_VER) || !(defined(__x86_64__) || defined(__i386__))

TEST(InterfaceLayout, NeedsTheItaniumAbiOnX86) { GTEST_SKIP() << "member function pointers are read the Itanium way"; }

#else

namespace {

// The slot of a virtual member function, counting the destructor at `destructorSlot` once; -1 when
// the pointer is not virtual.
template <class Signature, class Interface>
long slotOf(Signature Interface::*member, long destructorSlot)
{
    std::ptrdiff_t bits[2];
    static_assert(sizeof member == sizeof bits, "not an Itanium member function pointer");
    std::memcpy(bits, &member, sizeof bits);
    if ((bits[0] & 1) == 0) {
        return -1;
    }
    const long entry = static_cast<long>((bits[0] - 1) / static_cast<std::ptrdiff_t>(sizeof(void*)));
    return entry > destructorSlot ? entry - 1 : entry;
}

}  // namespace

TEST(InterfaceLayout, OverloadsKeepTheirSlots)
{
    using Str = const IZELServerString&;
    using A = IZELServerStringArray;
    using S = IZELServerSession;
    using R = IZELServerTransformationResult;
    using Rep = IZELServerRepository;
    using M = IZELServerMountPoint;
    const struct {
        const char* name;
        long slot;
        long expected;
    } cases[] = {
        {"append(string)", slotOf<void(Str)>(&A::append, 13), 0},
        {"append(char*)", slotOf<void(const char*)>(&A::append, 13), 1},
        {"removeAll(string)", slotOf<unsigned(Str)>(&A::removeAll, 13), 11},
        {"createConnectionInfo", slotOf<IZELServerConnectionInfo*(Str, Str, Str)>(&S::createConnectionInfo, 78), 2},
        {"createService", slotOf<IZELServerService*()>(&S::createService, 78), 21},
        {"getBoolProperty(string)", slotOf<unsigned(Str, unsigned&) const>(&R::getBoolProperty, 25), 24},
        {"getBoolProperty(std)", slotOf<unsigned(const std::string&, unsigned&) const>(&R::getBoolProperty, 25), 31},
        {"getItemResource",
         slotOf<IZELServerStatus*(Str, Str, Str, unsigned&, IZELServerProgressListener*)>(&Rep::getItemResource, 33),
         11},
        {"createPath", slotOf<IZELServerPath*(Str, Str)>(&M::createPath, 18), 16},
        {"createUserToken", slotOf<IZELServerUserToken*()>(&IZELServerSecurityManager::createUserToken, 9), 2},
    };
    for (const auto& c : cases) {
        EXPECT_EQ(c.slot, c.expected) << c.name;
    }
}

#endif
