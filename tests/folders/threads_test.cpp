// One translator, many threads.
#include "tests/folders/FolderRows.h"
#include "tests/folders/FolderServer.h"
#include <atomic>
#include <gtest/gtest.h>
#include <thread>

namespace
{
// Runs change that many times on a thread of its own, and translate on this one all the while. The lock is
// not a fair one, so each change waits for a translation after the one before.
template <typename CHANGE, typename TRANSLATE>
void RunTogether(int changes, CHANGE change, TRANSLATE translate)
{
    std::atomic<int> translations{0};
    std::atomic<bool> isOver{false};
    std::thread changing(
        [&]
        {
            for (int i = 0; i < changes; ++i)
            {
                change();
                for (int const seen = translations; translations == seen;)
                    std::this_thread::yield();
            }
            isOver = true;
        });
    while (!isOver)
    {
        translate();
        ++translations;
    }
    changing.join();
}
}  // namespace

// The first folder holds all others: a table of which only a part is loaded would give another form.
TEST(Threads, TranslationDuringLoad_NeverSeesAHalfBuiltTable)
{
    FolderServer server;
    for (FOLDER_ROW const& row : FolderRows)
        server.SetFolder(row.key, "/srv");
    server.SetFolder("System/Folders/Analytics", "/srv/analytics/folder");
    auto const folders = server.Translator();
    int wrong = 0;
    RunTogether(
        200, [&] { folders->Load(); },
        [&]
        {
            wrong += folders->Encode("/srv/analytics/folder/x") != "$(ANALYTICS)/x";
            wrong += folders->Decode("$(ANALYTICS)/x", false) != "/srv/analytics/folder/x";
            wrong += folders->Encode("System/Folders/Analytics", "x") != "$(ANALYTICS)/x";
            wrong += folders->EncodeV("ANALYTICS", "x") != "$(ANALYTICS)/x";
            wrong += !folders->IsEnabled();
        });
    EXPECT_EQ(wrong, 0);
}

TEST(Threads, TranslationWhileAMappingComesAndGoes_SeesItWholeOrNotAtAll)
{
    auto const folders = EmptyTranslator();
    std::string const path = "/a/folder/whose/name/lies/on/the/heap";
    bool isMapped = false;
    int seen = 0;
    int unseen = 0;
    int wrong = 0;
    RunTogether(
        200, [&] { folders->SetFolderVariable("X", (isMapped = !isMapped) ? path.c_str() : nullptr); },
        [&]
        {
            std::string const decoded = folders->Decode("$(X)", false);
            seen += decoded == path;
            unseen += decoded == "$(X)";
            wrong += decoded != path && decoded != "$(X)";
        });
    EXPECT_EQ(wrong, 0);
    EXPECT_GT(seen, 0);
    EXPECT_GT(unseen, 0);
}
