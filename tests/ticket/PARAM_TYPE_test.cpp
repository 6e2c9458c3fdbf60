#include "comgui/ticket/PARAM_TYPE.h"

#include <gtest/gtest.h>
#include <type_traits>

TEST(PARAM_TYPE, HasTheValuesTheModuleKnows)
{
    EXPECT_EQ(PARAM_NONE, 0);
    EXPECT_EQ(PARAM_POINTER, 1);
    EXPECT_EQ(PARAM_INT, 2);
    EXPECT_EQ(PARAM_DOUBLE, 3);
    EXPECT_EQ(PARAM_STRING, 4);
    EXPECT_EQ(PARAM_BINSTRING, 5);
    EXPECT_EQ(PARAM_COUNT, 6);
    EXPECT_EQ(PARAM_INT64, 7);
    EXPECT_EQ(PARAM_UNSIGNED, 8);
    EXPECT_EQ(PARAM_UNSIGNED64, 9);
}

TEST(PARAM_TYPE, IsA32BitInt) { EXPECT_TRUE((std::is_same_v<std::underlying_type_t<PARAM_TYPE>, int>)); }

TEST(GetParamType, MapsEachElementType)
{
    EXPECT_EQ(GetParamType<void*>(), 1);
    EXPECT_EQ(GetParamType<int>(), 2);
    EXPECT_EQ(GetParamType<double>(), 3);
    EXPECT_EQ(GetParamType<char const*>(), 4);
    EXPECT_EQ(GetParamType<long long>(), 7);
    EXPECT_EQ(GetParamType<unsigned int>(), 8);
    EXPECT_EQ(GetParamType<unsigned long long>(), 9);
}
