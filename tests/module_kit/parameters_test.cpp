#include "comgui/module/Parameters.h"

#include <gmock/gmock.h>

using comgui::plugin::IsNone;
using comgui::plugin::LargestPosition;
using comgui::plugin::Parameters;
using comgui::plugin::Value;
using testing::ElementsAre;

namespace
{
std::vector<std::string> Lines(Parameters const& parameters, std::string_view prefix = "")
{
    std::vector<std::string> lines;
    for (auto const& [key, value, pos] : parameters.All(prefix))
        lines.push_back(key + "[" + std::to_string(pos) + "]=" + std::to_string(std::get<int>(value)));
    return lines;
}
}  // namespace

TEST(ParametersOfATicket, Write_AtMinus1_StartsTheKeyAnew)
{
    Parameters parameters;
    EXPECT_TRUE(parameters.Write("K", 1, 0));
    EXPECT_TRUE(parameters.Write("K", 2, 1));
    EXPECT_TRUE(parameters.Write("K", 3, -1));
    EXPECT_THAT(Lines(parameters), ElementsAre("K[0]=3"));
}

TEST(ParametersOfATicket, Write_AtMinus2_AppendsBehindTheLast)
{
    Parameters parameters;
    EXPECT_TRUE(parameters.Write("K", 1, -2));
    EXPECT_TRUE(parameters.Write("K", 2, 4));
    EXPECT_TRUE(parameters.Write("K", 3, -2));
    EXPECT_THAT(Lines(parameters), ElementsAre("K[0]=1", "K[4]=2", "K[5]=3"));
    EXPECT_EQ(parameters.Count("K"), 6);
}

TEST(ParametersOfATicket, Write_AtTheLargestPosition_LeavesNoPlaceBehind)
{
    Parameters parameters;
    EXPECT_TRUE(parameters.Write("K", 1, LargestPosition));
    EXPECT_FALSE(parameters.Write("K", 2, LargestPosition + 1));
    EXPECT_FALSE(parameters.Write("K", 2, -2));
    EXPECT_EQ(parameters.Count("K"), LargestPosition + 1);
}

TEST(ParametersOfATicket, NoValue_Deletes)
{
    Parameters parameters;
    EXPECT_TRUE(parameters.Write("K", 1, 0));
    EXPECT_TRUE(parameters.Write("K", 2, 1));
    EXPECT_TRUE(parameters.Write("K", Value(), 0));
    EXPECT_THAT(Lines(parameters), ElementsAre("K[1]=2"));
    EXPECT_TRUE(IsNone(parameters.Read("K", 0)));
    EXPECT_TRUE(parameters.Write("K", Value(), 1));
    EXPECT_TRUE(parameters.IsEmpty());
    EXPECT_TRUE(parameters.Write("Missing", Value(), -1));
    EXPECT_FALSE(parameters.Write("K", Value(), -2));
}

TEST(ParametersOfATicket, WhatNoTicketHolds_IsRefused)
{
    Parameters parameters;
    EXPECT_FALSE(parameters.Write("", 1, -1));
    EXPECT_FALSE(parameters.Write("K", 1, -3));
    EXPECT_FALSE(parameters.Write("K", comgui::plugin::NeverStored(), -1));
    EXPECT_TRUE(parameters.IsEmpty());
}

TEST(ParametersOfATicket, All_GoesByKeyBytewiseAndByPrefix)
{
    Parameters parameters;
    for (char const* const key : {"b", "a/1", "a", "\xC3\xA4", "B"})
        EXPECT_TRUE(parameters.Write(key, 1, -1));
    EXPECT_THAT(Lines(parameters), ElementsAre("B[0]=1", "a[0]=1", "a/1[0]=1", "b[0]=1", "\xC3\xA4[0]=1"));
    EXPECT_THAT(Lines(parameters, "a"), ElementsAre("a[0]=1", "a/1[0]=1"));
}
