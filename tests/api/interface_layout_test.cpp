// Slot positions of the public interfaces. A client calls every operation through its position in the
// virtual table, so a declaration moved in a header (an overload put next to its namesake, a getter
// slipped in front of the destructor) breaks clients that still compile without a murmur.
//
// Positions are read from pointers to member functions, whose bytes the Itanium C++ ABI defines: for
// a virtual function they hold the byte offset of its table entry, marked as virtual by a set low bit
// (on ARM the mark sits in the adjustment word and the offset is stored as it is). Nothing is ever
// called through a table. The ABI gives a virtual destructor two entries (complete and deleting)
// where our slot numbering counts one, so every slot behind the destructor sits one entry further on.

#include <gtest/gtest.h>

#include <zelserverapi/interfaces.h>

#include <cstddef>
#include <cstring>
#include <initializer_list>

#if defined(_MSC_VER)

TEST(InterfaceLayout, NeedsTheItaniumAbi) { GTEST_SKIP() << "member function pointers are read the Itanium way only"; }

#else

namespace {

struct MemberFunctionBits {
    std::ptrdiff_t ptr;
    std::ptrdiff_t adj;
};

constexpr std::ptrdiff_t kEntrySize = sizeof(void*);

// The table entry a virtual member function occupies, or -1 when the pointer is not virtual.
template <class Signature, class Interface>
long entryOf(Signature Interface::*member)
{
    static_assert(sizeof member == sizeof(MemberFunctionBits), "not an Itanium member function pointer");
    MemberFunctionBits bits;
    std::memcpy(&bits, &member, sizeof bits);
#if defined(__arm__) || defined(__aarch64__)
    if ((bits.adj & 1) == 0)
        return -1;
    return static_cast<long>(bits.ptr / kEntrySize);
#else
    if ((bits.ptr & 1) == 0)
        return -1;
    return static_cast<long>((bits.ptr - 1) / kEntrySize);
#endif
}

struct SlotCase {
    const char* operation;
    long entry;
    int slot;
};

void expectSlots(const char* interface, int destructorSlot, std::initializer_list<SlotCase> cases)
{
    for (const SlotCase& c : cases) {
        const long expected = c.slot < destructorSlot ? c.slot : c.slot + 1;
        EXPECT_EQ(c.entry, expected) << interface << "::" << c.operation << " must be slot " << c.slot;
    }
}

}  // namespace

// One operation by name, or one overload by its exact signature.
#define SLOT(I, name, n)                                                                                               \
    SlotCase { #name, entryOf(&I::name), n }
#define OVERLOAD(I, name, signature, n)                                                                                \
    SlotCase { #name " " #signature, entryOf<signature>(&I::name), n }

// Overloads, whose order a header can change silently, and slots on either side of the destructor.
TEST(InterfaceLayout, OverloadsAndSlotsAroundTheDestructorKeepTheirPlaces)
{
    using Str = const IZELServerString&;
    using A = IZELServerStringArray;
    expectSlots("IZELServerStringArray", 13,
                {OVERLOAD(A, append, void(const IZELServerString&), 0), OVERLOAD(A, append, void(const char*), 1),
                 OVERLOAD(A, removeAll, unsigned(const IZELServerString&), 11),
                 OVERLOAD(A, removeAll, unsigned(const char*), 12)});
    using S = IZELServerSession;
    expectSlots("IZELServerSession", 78,
                {OVERLOAD(S, createConnectionInfo, IZELServerConnectionInfo * (Str, Str, Str), 2),
                 OVERLOAD(S, createTransformationRequest, IZELServerTransformationRequest * (Str, Str, Str), 14),
                 OVERLOAD(S, createTransformationResult, IZELServerTransformationResult * (), 18),
                 OVERLOAD(S, createService, IZELServerService * (), 21), SLOT(S, destroyFileInfoVector, 77)});
    using R = IZELServerTransformationResult;
    using Raw = const std::string&;
    expectSlots("IZELServerTransformationResult", 25,
                {OVERLOAD(R, getBoolProperty, unsigned(Str, unsigned&) const, 24), SLOT(R, lookupProperty, 26),
                 OVERLOAD(R, getStringProperty, unsigned(Raw, IZELServerString&) const, 27),
                 OVERLOAD(R, getBoolProperty, unsigned(Raw, unsigned&) const, 31), SLOT(R, findProperty, 35)});
    using Rep = IZELServerRepository;
    using Listener = IZELServerProgressListener*;
    expectSlots("IZELServerRepository", 33,
                {OVERLOAD(Rep, getItem, IZELServerStatus * (Str, Str, unsigned&), 4),
                 OVERLOAD(Rep, getItemResource, IZELServerStatus * (Str, Str, Str, unsigned&, Listener), 11),
                 SLOT(Rep, getItemResourceView, 12),
                 OVERLOAD(Rep, getItemResource, IZELServerStatus * (Str, Str, Str, unsigned&), 13),
                 SLOT(Rep, getTemplateView, 32)});
    using M = IZELServerMountPoint;
    using Path = const IZELServerPath&;
    expectSlots("IZELServerMountPoint", 18,
                {OVERLOAD(M, list, IZELServerStatus * (Path, IZELServerVector<IZELServerFileInfo>&), 11),
                 OVERLOAD(M, createPath, IZELServerPath * (Str, Str), 16), SLOT(M, releaseObject, 17),
                 SLOT(M, readFromXML, 19)});
    using Sec = IZELServerSecurityManager;
    expectSlots("IZELServerSecurityManager", 9,
                {OVERLOAD(Sec, createUserToken, IZELServerUserToken * (), 2), SLOT(Sec, userTokenExpired, 8)});
}

#endif
