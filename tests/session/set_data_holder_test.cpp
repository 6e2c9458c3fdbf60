// One value that a host prepares for a write of many.
#include "comgui/session/SetDataHolder.h"

#include "tests/support/Callocs.h"
#include <bit>
#include <csignal>
#include <cstring>
#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <limits>
#include <new>
#include <set>
#include <string>

using testing::AllOf;
using testing::Each;
using testing::HasSubstr;
using testing::KilledBySignal;

namespace
{
char text[] = "text";

// A holder in memory that was not zero, and what its bytes are.
class SetDataHolderBytes : public testing::Test
{
protected:
    SetDataHolderBytes() { std::memset(storage, 0xFF, sizeof storage); }
    ~SetDataHolderBytes() override { holder->~SetDataHolder(); }

    void Make(wxString const& key) { holder = new (storage) SetDataHolder(key, PARAM_POINTER, nullptr, -1); }

    std::string Bytes(std::size_t from, std::size_t to) const
    {
        return {reinterpret_cast<char const*>(storage) + from, to - from};
    }

    alignas(SetDataHolder) unsigned char storage[sizeof(SetDataHolder)];
    SetDataHolder* holder = nullptr;
};
}  // namespace

TEST(SetDataHolder, KeepsKeyTypeAndPosition)
{
    SetDataHolder const holder("Job/Copies", PARAM_POINTER, nullptr, 5);
    EXPECT_STREQ(holder.key, "Job/Copies");
    EXPECT_EQ(holder.m_type, PARAM_POINTER);
    EXPECT_EQ(holder.m_pos, 5);
}

TEST(SetDataHolder, Key_IsUtf8)
{
    SetDataHolder const holder(wxString::FromUTF8("K\xC3\xA4y"), PARAM_NONE, nullptr, -1);
    EXPECT_STREQ(holder.key, "K\xC3\xA4y");
}

TEST_F(SetDataHolderBytes, KeyOf255Bytes_Fits)
{
    Make(wxString('k', 255));
    EXPECT_EQ(Bytes(0, 256), std::string(255, 'k') + '\0');
    EXPECT_EQ(holder->m_type, PARAM_POINTER);
}

TEST_F(SetDataHolderBytes, AreZeroWhereThereIsNothing_BetweenTheFieldsToo)
{
    Make("Key");
    EXPECT_THAT(Bytes(3, 256), Each('\0'));
    EXPECT_THAT(Bytes(260, 272), Each('\0'));  // a gap, and the value
    EXPECT_THAT(Bytes(276, 280), Each('\0'));
}

TEST(SetDataHolder, Int_IsCopied)
{
    int value = std::numeric_limits<int>::min();
    SetDataHolder const holder("Key", PARAM_INT, &value, -1);
    value = 0;
    ASSERT_NE(holder.m_value, &value);
    EXPECT_EQ(*static_cast<int*>(holder.m_value), std::numeric_limits<int>::min());
}

TEST(SetDataHolder, Double_IsCopiedBitByBit)
{
    double value = std::numeric_limits<double>::signaling_NaN();
    SetDataHolder const holder("Key", PARAM_DOUBLE, &value, -1);
    ASSERT_NE(holder.m_value, &value);
    unsigned long long copy = 0;
    std::memcpy(&copy, holder.m_value, sizeof copy);
    EXPECT_EQ(copy, std::bit_cast<unsigned long long>(value));
}

TEST(SetDataHolder, Text_IsCopiedAsItStands)
{
    char value[] = "Gr\xC3\xBC\xFFn";
    SetDataHolder const holder("Key", PARAM_STRING, value, -1);
    value[0] = 'x';
    ASSERT_NE(holder.m_value, value);
    EXPECT_STREQ(static_cast<char*>(holder.m_value), "Gr\xC3\xBC\xFFn");
}

// Whoever reads it as wide finds an end within the copy; behind it is none.
TEST(SetDataHolder, TextOfAnyLength_IsATerminatedWideTextAsWell)
{
    for (std::size_t length = 0; length < 10; ++length)
    {
        std::string value(length, 'a');
        SetDataHolder const holder("Key", PARAM_STRING, value.data(), -1);
        EXPECT_EQ(std::wcslen(static_cast<wchar_t*>(holder.m_value)), (length + 3) / 4);
    }
}

TEST(SetDataHolder, AnyOtherType_HasNoValueAndTheGivenOneIsNotLookedAt)
{
    void* const nowhere = reinterpret_cast<void*>(1);
    for (int type = -1; type <= 11; ++type)
        if (type != PARAM_INT && type != PARAM_DOUBLE && type != PARAM_STRING)
        {
            SetDataHolder const holder("Key", static_cast<PARAM_TYPE>(type), nowhere, -1);
            EXPECT_EQ(holder.m_value, nullptr) << type;
            EXPECT_EQ(holder.m_type, type);
        }
}

// --- without memory ----------------------------------------------------------------------------------------

namespace
{
void MakeWithoutMemory(PARAM_TYPE type, void* value)
{
    wxString const key("Key");
    FailingCalloc const failing(0);
    SetDataHolder const holder(key, type, value, -1);
}

// The three of them as the C library tells a failed assertion, whatever its order and words.
auto const Assertion = AllOf(HasSubstr("this->m_value"), HasSubstr("SetDataHolder"),
                             HasSubstr("Ticket Server Layer/ComGUIManager"));
}  // namespace

TEST(SetDataHolderDeathTest, WithoutMemoryForAnInt_EndsTheProcessByAnAssertion)
{
    int value = 5;
    EXPECT_EXIT(MakeWithoutMemory(PARAM_INT, &value), KilledBySignal(SIGABRT), Assertion);
}

TEST(SetDataHolderDeathTest, WithoutMemoryForADouble_EndsTheProcessByAnAssertion)
{
    double value = 5;
    EXPECT_EXIT(MakeWithoutMemory(PARAM_DOUBLE, &value), KilledBySignal(SIGABRT), Assertion);
}

TEST(SetDataHolderDeathTest, WithoutMemoryForAText_EndsTheProcessByAnAssertion)
{
    EXPECT_EXIT(MakeWithoutMemory(PARAM_STRING, text), KilledBySignal(SIGABRT), Assertion);
}

TEST(SetDataHolderDeathTest, AssertionsOfTheThreeTypes_ToldApartByTheirLines)
{
    std::set<std::string> messages;
    auto const keep = testing::Truly([&](std::string const& said) { return messages.insert(said).second; });
    double value = 5;
    EXPECT_EXIT(MakeWithoutMemory(PARAM_INT, &value), KilledBySignal(SIGABRT), keep);
    EXPECT_EXIT(MakeWithoutMemory(PARAM_DOUBLE, &value), KilledBySignal(SIGABRT), keep);
    EXPECT_EXIT(MakeWithoutMemory(PARAM_STRING, text), KilledBySignal(SIGABRT), keep);
    EXPECT_EQ(messages.size(), 3u);
}

TEST(SetDataHolder, WithoutMemory_AHolderThatNeedsNoneIsMade) { MakeWithoutMemory(PARAM_POINTER, nullptr); }
