#include "comgui/foundation/utf8func.h"

#include "comgui/testing/TemporaryFolder.h"

#include <array>
#include <cerrno>
#include <gtest/gtest.h>
#include <memory>
#include <string>

using comgui::test::TemporaryFolder;

namespace
{
struct CLOSER
{
    void operator()(FILE* file) const { std::fclose(file); }
};

class Utf8Fopen : public testing::Test
{
protected:
    std::unique_ptr<FILE, CLOSER> Open(std::string const& name, char const* mode)
    {
        return std::unique_ptr<FILE, CLOSER>(utf8func::fopen((folder.Path() / name).c_str(), mode));
    }

    std::string Read(std::string const& name)
    {
        std::array<char, 100> bytes;
        auto const file = Open(name, "rb");
        return file ? std::string(bytes.data(), std::fread(bytes.data(), 1, bytes.size(), file.get()))
                    : "no file";
    }

    TemporaryFolder folder;
};
}  // namespace

TEST_F(Utf8Fopen, NameInUtf8_FindsTheFileOfTheseBytes)
{
    folder.Write("\xC3\x84pfel \xE6\x97\xA5.stk", "text");
    EXPECT_EQ(Read("\xC3\x84pfel \xE6\x97\xA5.stk"), "text");
}

TEST_F(Utf8Fopen, Mode_DecidesWhetherTheFileIsMadeAnewOrContinued)
{
    ASSERT_GE(std::fputs("one", Open("a", "wb").get()), 0);
    ASSERT_GE(std::fputs("two", Open("a", "wb").get()), 0);
    ASSERT_GE(std::fputs("three", Open("a", "ab").get()), 0);
    EXPECT_EQ(Read("a"), "twothree");
}

TEST_F(Utf8Fopen, MissingFile_GivesNullAndTheReason)
{
    errno = 0;
    EXPECT_EQ(Open("missing", "rb"), nullptr);
    EXPECT_EQ(errno, ENOENT);
}
