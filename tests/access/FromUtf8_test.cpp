// What the quick form gives against what wxWidgets itself does.
#include "comgui/access/FromUtf8.h"

#include <gtest/gtest.h>
#include <random>
#include <string>

using comgui::detail::FromUtf8;

TEST(FromUtf8, Null_IsTheEmptyText) { EXPECT_EQ(FromUtf8(nullptr), wxString()); }

TEST(FromUtf8, Ascii_OfEverySize_ComesAsItIs)
{
    std::string text;
    for (int size = 0; size < 600; ++size)
    {
        wxString const wide = FromUtf8(text.c_str());
        ASSERT_EQ(wide.length(), text.size());
        ASSERT_EQ(wide.utf8_string(), text);
        text += static_cast<char>(1 + size % 127);
    }
}

TEST(FromUtf8, OtherCharacter_AnywhereInTheText_IsDecoded)
{
    for (std::size_t const size : {0u, 1u, 2u, 3u, 4u, 5u, 7u, 8u, 9u, 15u, 16u, 17u, 254u, 255u, 256u, 300u})
        for (std::size_t at = 0; at <= size; ++at)
        {
            std::string text(size, 'x');
            text.insert(at, "\xC3\xA4");
            wxString expected(std::string(size, 'x'));
            expected.insert(at, 1, wxUniChar(0xE4));
            ASSERT_EQ(FromUtf8(text.c_str()), expected) << size << ' ' << at;
        }
}

TEST(FromUtf8, WhatIsNoUtf8_IsTheEmptyText)
{
    for (char const* const text : {"\xFF", "a\xC3", "\x80 and what follows, which is long", "\xED\xA0\x80"})
        EXPECT_EQ(FromUtf8(text), wxString::FromUTF8(text)) << text;
    EXPECT_EQ(FromUtf8("abc\xFF"), wxString());
}

TEST(FromUtf8, RandomBytes_BecomeWhatWxWidgetsMakesOfThem)
{
    std::mt19937 random(1);
    for (int round = 0; round < 20000; ++round)
    {
        std::string text;
        for (std::size_t size = random() % 40; size > 0; --size)
            text += static_cast<char>(random() % 8 == 0 ? random() % 256 : 'a' + random() % 26);
        ASSERT_EQ(FromUtf8(text.c_str()), wxString::FromUTF8(text.c_str())) << text;
    }
}
