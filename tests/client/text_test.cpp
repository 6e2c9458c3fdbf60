// Texts of tickets as windows and terminals take them.
#include "comgui/client/Text.h"

#include <gtest/gtest.h>

using namespace comgui;

TEST(Text, GoesToWxAndBack)
{
    std::string const text = "Gr\xC3\xB6\xC3\x9F"
                             "e \xE5\x8D\xB0 \xF0\x9F\x96\xA8";
    EXPECT_EQ(ToWx(text).size(), 9u);
    EXPECT_EQ(ToUtf8(ToWx(text)), text);
}

TEST(Text, BytesThatAreNoUtf8_AreReplacedOneByOne)
{
    EXPECT_EQ(ToUtf8(ToWx("a\xFF\xFE"
                          "b")),
              "a\xEF\xBF\xBD\xEF\xBF\xBD"
              "b");
    for (char const* const bad : {"\xC0\xAF", "\xED\xA0", "\xF4\x90", "\xE0\x80", "\xC3"})
        for (wxUniChar const c : ToWx(bad))
            EXPECT_EQ(c.GetValue(), 0xFFFDu) << bad;
}

TEST(Text, ZeroByte_IsKept) { EXPECT_EQ(ToWx(std::string_view("a\0b", 3)).size(), 3u); }
