#include "comgui/access/FilenameToTicket.h"

#include <gtest/gtest.h>

TEST(FilenameToTicket, EveryBackslash_BecomesAForwardSlash)
{
    EXPECT_EQ(FilenameToTicket("C:\\a\\\\b\\"), "C:/a//b/");
}

TEST(FilenameToTicket, NameWithoutBackslashes_ComesBackEqual)
{
    wxString const name = wxString::FromUTF8("/a/Gr\xC3\xBCn b");
    EXPECT_EQ(FilenameToTicket(name), name);
    EXPECT_EQ(FilenameToTicket(""), "");
}
