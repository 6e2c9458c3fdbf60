// What modules rely on when they hand out a translator.
#include "comgui/ticket/clFOLDER_VARIABLES.h"

#include <cstring>
#include <gtest/gtest.h>
#include <type_traits>

namespace
{
// A pointer to a virtual member begins with its slot's offset in bytes; on some processors the lowest bit
// says that it is virtual.
template <typename Member>
long SlotOf(Member member)
{
    long words[2] = {};
    static_assert(sizeof words == sizeof member);
    std::memcpy(words, &member, sizeof words);
    return (words[0] & ~1L) / static_cast<long>(sizeof(void*));
}

using Folders = clFOLDER_VARIABLES;
using EncodePath = std::string (Folders::*)(std::string const&) const;
using EncodeBelowKey = std::string (Folders::*)(char const*, std::string) const;
}  // namespace

TEST(FolderVariablesInterface, Slots_StandInTheirFrozenOrder)
{
    // Slots 0 and 1 are the destructor's two forms.
    EXPECT_EQ(SlotOf(&Folders::IsEnabled), 2);
    EXPECT_EQ(SlotOf(&Folders::Load), 3);
    EXPECT_EQ(SlotOf(static_cast<EncodePath>(&Folders::Encode)), 4);
    EXPECT_EQ(SlotOf(static_cast<EncodeBelowKey>(&Folders::Encode)), 5);
    EXPECT_EQ(SlotOf(&Folders::EncodeV), 6);
    EXPECT_EQ(SlotOf(&Folders::Decode), 7);
    EXPECT_EQ(SlotOf(&Folders::SetFolderVariable), 8);
    EXPECT_EQ(SlotOf(&Folders::New_clSETMULTIPAR_FOLDER_VARIABLES), 9);
}

TEST(FolderVariablesInterface, Object_IsATableOfSlotsWithoutData)
{
    EXPECT_EQ(sizeof(Folders), sizeof(void*));
    EXPECT_TRUE(std::has_virtual_destructor_v<Folders>);
    EXPECT_TRUE(std::is_abstract_v<Folders>);
}
