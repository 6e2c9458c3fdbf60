// What a translation takes from the heap, and what is left when there is nothing to take.
#include "comgui/folders/clSETMULTIPAR_FOLDER_VARIABLES.h"
#include "tests/folders/FolderRows.h"
#include "tests/folders/FolderServer.h"
#include "tests/support/Allocations.h"
#include <future>
#include <gtest/gtest.h>
#include <new>

namespace
{
class Allocations : public testing::Test
{
protected:
    Allocations()
    {
        for (FOLDER_ROW const& row : FolderRows)
            server.SetFolder(row.key, std::string("/srv/print/folders/") + row.variable);
        folders = server.Translator();
    }

    // Of a translation, which fails as a whole when there is no memory, and holds nothing then.
    template <typename TRANSLATE>
    int Of(TRANSLATE translate, char const* expected)
    {
        bool isThrown = false;
        return FailEachAllocation(
            [&]
            {
                isThrown = false;
                try
                {
                    std::string const translated = translate();
                    FailingAllocation::Stop();
                    EXPECT_EQ(translated, expected);
                }
                catch (std::bad_alloc const&)
                {
                    isThrown = true;
                }
            },
            [&](bool hasFailed)
            {
                EXPECT_EQ(isThrown, hasFailed);
                // Another thread would wait for ever if the lock had stayed behind.
                EXPECT_TRUE(std::async(std::launch::async, [&] { return folders->IsEnabled(); }).get());
            });
    }

    FolderServer server;
    std::unique_ptr<clFOLDER_VARIABLES> folders;
    // Too long to lie inside a string.
    std::string const path = "/srv/print/folders/ANALYTICS/some/job/with/a/long/name.tif";
    std::string const form = "$(ANALYTICS)/some/job/with/a/long/name.tif";
    std::string const outside = "C:\\some\\other\\folder\\with\\a\\long\\name.tif";
};
}  // namespace

TEST_F(Allocations, OfEncode_AreTheResultAlone)
{
    EXPECT_EQ(Of([&] { return folders->Encode(path); }, form.c_str()), 1);
    EXPECT_EQ(Of([&] { return folders->Encode(outside); }, outside.c_str()), 1);
    EXPECT_EQ(Of([&] { return folders->Encode("/srv/print/folders/LOG/x"); }, "$(LOG)/x"),
              1);  // the argument
}

TEST_F(Allocations, OfDecode_AreTheResultAlone)
{
    EXPECT_EQ(Of([&] { return folders->Decode(form, false); }, path.c_str()), 1);
    EXPECT_EQ(Of([&] { return folders->Decode(outside, true); }, outside.c_str()), 1);
    EXPECT_EQ(
        Of([&] { return folders->Decode(outside, false); }, "C:/some/other/folder/with/a/long/name.tif"), 1);
}

TEST_F(Allocations, OfEncodeBelowAFolder_AreTheArgumentAndTheResult)
{
    char const* const expected = "$(LOG)/some/job/with/a/long/name.tif";
    std::string const relative = "some\\job\\with\\a\\long\\name.tif";
    EXPECT_EQ(Of([&] { return folders->Encode("System/Folders/Log", relative); }, expected), 2);
    EXPECT_EQ(Of([&] { return folders->EncodeV("LOG", relative); }, expected), 2);
    EXPECT_EQ(Of([&] { return folders->Encode("Nope", relative); }, relative.c_str()), 1);
}

TEST_F(Allocations, OfATableWithoutTexts_AreNone)
{
    int const number = 7;
    SETMULTIPAR table[] = {
        {"I", PARAM_INT, 0, &number, -1, false, {}}, {"E", PARAM_STRING, 0, "", -1, false, {}}, {}};
    auto const translate = [&]
    { clSETMULTIPAR_FOLDER_VARIABLES const translated(folders.get(), table, true); };
    EXPECT_EQ(FailEachAllocation(translate, [](bool) {}), 0);
}
