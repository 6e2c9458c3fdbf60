// Keys as rows of a tree. Rows are written as text: two blanks for each level, "+" before a closed branch,
// "-" before an open one, and "*" behind a key.
#include "desk/model/KeyOutline.h"

#include <chrono>
#include <gtest/gtest.h>
#include <random>
#include <set>

using namespace desk;

namespace
{
using Rows = std::vector<std::string>;

std::string TextOf(OutlineRow const& row)
{
    return std::string(2 * row.depth, ' ') + (row.isBranch ? (row.isOpen ? "-" : "+") : "") + row.name +
           (row.key ? "*" : "");
}

Rows RowsOf(KeyOutline const& outline)
{
    Rows rows;
    for (std::size_t row = 0; row < outline.RowCount(); ++row)
        rows.push_back(TextOf(outline.RowAt(row)));
    return rows;
}

KeyOutline Shown(std::vector<std::string_view> const& keys)
{
    KeyOutline outline;
    outline.Show(keys);
    return outline;
}

KeyOutline AllOpen(std::vector<std::string_view> const& keys)
{
    KeyOutline outline = Shown(keys);
    outline.OpenAll();
    return outline;
}

// What a list makes of a change; it must end with the rows that the outline has.
void Follow(Rows& rows, OutlineChange change, KeyOutline const& outline)
{
    auto const first = rows.begin() + static_cast<std::ptrdiff_t>(change.row);
    rows.erase(first, first + static_cast<std::ptrdiff_t>(change.removed));
    for (std::size_t i = 0; i < change.added; ++i)
        rows.insert(rows.begin() + static_cast<std::ptrdiff_t>(change.row + i),
                    outline.PathAt(change.row + i));
}

Rows PathsOf(KeyOutline const& outline)
{
    Rows paths;
    for (std::size_t row = 0; row < outline.RowCount(); ++row)
        paths.push_back(outline.PathAt(row));
    return paths;
}

// 100 branches of 1,000 keys.
std::vector<std::string> ManyKeys()
{
    std::vector<std::string> keys;
    for (int i = 0; i < 100'000; ++i)
        keys.push_back("Branch" + std::to_string(100 + i / 1000) + "/Key" + std::to_string(1000 + i % 1000));
    return keys;
}

std::vector<std::string_view> ViewOf(std::vector<std::string> const& keys)
{
    return {keys.begin(), keys.end()};
}

// Some times what it takes on an idle machine, so that only another order of growth fails.
template <typename Do>
void ExpectWithin(std::chrono::milliseconds most, Do run)
{
    auto const begin = std::chrono::steady_clock::now();
    run();
    EXPECT_LT(std::chrono::steady_clock::now() - begin, most);
}
}  // namespace

TEST(KeyOutline, HasNoRowsAtFirst)
{
    KeyOutline const outline;
    EXPECT_EQ(outline.RowCount(), 0U);
    EXPECT_EQ(outline.RowOf("a"), std::nullopt);
}

TEST(KeyOutline, BranchesAreClosedAtFirst)
{
    EXPECT_EQ(RowsOf(Shown({"Job/Copies", "Job/Title", "Name"})), (Rows{"+Job", "Name*"}));
}

TEST(KeyOutline, OpenBranchShowsWhatLiesBelow)
{
    auto outline = Shown({"Job/Copies", "Job/Ink/Cyan", "Name"});
    auto const change = outline.Open(0);
    EXPECT_EQ(RowsOf(outline), (Rows{"-Job", "  Copies*", "  +Ink", "Name*"}));
    EXPECT_EQ(change.row, 1U);
    EXPECT_EQ(change.added, 2U);
}

TEST(KeyOutline, ClosedBranchHidesAllBelow)
{
    auto outline = AllOpen({"Job/Copies", "Job/Ink/Cyan", "Name"});
    auto const change = outline.Toggle(0);
    EXPECT_EQ(RowsOf(outline), (Rows{"+Job", "Name*"}));
    EXPECT_EQ(change.row, 1U);
    EXPECT_EQ(change.removed, 3U);
}

TEST(KeyOutline, ReopenedBranchIsAsItWas)
{
    auto outline = AllOpen({"a/b/c", "a/d/e"});
    outline.Close(3);
    outline.Close(0);
    outline.Toggle(0);
    EXPECT_EQ(RowsOf(outline), (Rows{"-a", "  -b", "    c*", "  +d"}));
}

TEST(KeyOutline, KeyIsNotOpened)
{
    auto outline = Shown({"a"});
    EXPECT_TRUE(outline.Open(0).IsNone());
    EXPECT_TRUE(outline.Toggle(0).IsNone());
    EXPECT_TRUE(outline.Close(0).IsNone());
}

TEST(KeyOutline, KeyMayBeABranch)
{
    auto const outline = AllOpen({"Job", "Job-2", "Job/Copies"});
    EXPECT_EQ(RowsOf(outline), (Rows{"-Job*", "  Copies*", "Job-2*"}));
    EXPECT_EQ(outline.RowAt(0).key, "Job");
}

TEST(KeyOutline, WholeKeyIsTold)
{
    auto const outline = AllOpen({"a/b/c"});
    EXPECT_EQ(outline.RowAt(2).key, "a/b/c");
    EXPECT_EQ(outline.RowAt(1).key, std::nullopt);
    EXPECT_EQ(outline.PathAt(1), "a/b");
}

TEST(KeyOutline, KeysMayComeInAnyOrderAndTwice)
{
    auto const outline = AllOpen({"b", "a/c", "b", "a/b"});
    EXPECT_EQ(RowsOf(outline), (Rows{"-a", "  b*", "  c*", "b*"}));
    EXPECT_EQ(outline.KeyCount(), 3U);
}

struct ODD_FACT
{
    char const* name;
    std::string key;
    Rows rows;
};

class OddKey : public testing::TestWithParam<ODD_FACT>
{
};

TEST_P(OddKey, IsShownPartByPart) { EXPECT_EQ(RowsOf(AllOpen({GetParam().key})), GetParam().rows); }

TEST_P(OddKey, IsReached)
{
    auto outline = Shown({"Other", GetParam().key});
    outline.Reveal(GetParam().key);
    auto const row = outline.RowOf(GetParam().key);
    ASSERT_TRUE(row);
    EXPECT_EQ(outline.RowAt(*row).key, GetParam().key);
}

TEST_P(OddKey, ComesAndGoes)
{
    auto outline = AllOpen({"Other"});
    EXPECT_FALSE(outline.Insert(GetParam().key).IsNone());
    EXPECT_EQ(outline.KeyCount(), 2U);
    EXPECT_FALSE(outline.Remove(GetParam().key).IsNone());
    EXPECT_EQ(RowsOf(outline), Rows{"Other*"});
}

INSTANTIATE_TEST_SUITE_P(
    Facts, OddKey,
    testing::Values(ODD_FACT{"Empty", "", {"*"}}, ODD_FACT{"Slash", "/", {"-", "  *"}},
                    ODD_FACT{"Leading", "/a", {"-", "  a*"}}, ODD_FACT{"Trailing", "a/", {"-a", "  *"}},
                    ODD_FACT{"Doubled", "a//b", {"-a", "  -", "    b*"}},
                    ODD_FACT{"Zero", std::string("a\0b", 3), {std::string("a\0b*", 4)}},
                    ODD_FACT{"Bytes2000", std::string(2000, 'x'), {std::string(2000, 'x') + '*'}},
                    ODD_FACT{"NoUtf8", "\xFF", {"\xFF*"}}),
    [](auto const& fact) { return std::string(fact.param.name); });

TEST(KeyOutline, OddKeysStandSideBySide)
{
    EXPECT_EQ(RowsOf(AllOpen({"", "/", "a", "a/", "a//"})), (Rows{"-*", "  *", "-a*", "  -*", "    *"}));
}

TEST(KeyOutline, InsertedKeyStandsInItsPlace)
{
    auto outline = AllOpen({"a/b", "a/d", "e"});
    auto const change = outline.Insert("a/c");
    EXPECT_EQ(RowsOf(outline), (Rows{"-a", "  b*", "  c*", "  d*", "e*"}));
    EXPECT_EQ(change.row, 2U);
    EXPECT_EQ(change.added, 1U);
}

TEST(KeyOutline, KeyBelowAClosedBranchAddsNoRow)
{
    auto outline = Shown({"a/b"});
    EXPECT_TRUE(outline.Insert("a/c").IsNone());
    EXPECT_EQ(RowsOf(outline), Rows{"+a"});
    outline.Open(0);
    EXPECT_EQ(RowsOf(outline), (Rows{"-a", "  b*", "  c*"}));
}

TEST(KeyOutline, InsertTwiceIsOnce)
{
    auto outline = Shown({"a"});
    EXPECT_TRUE(outline.Insert("a").IsNone());
    EXPECT_EQ(outline.KeyCount(), 1U);
}

TEST(KeyOutline, RemoveOfNoKeyChangesNothing)
{
    auto outline = Shown({"a/b"});
    EXPECT_TRUE(outline.Remove("a").IsNone());
    EXPECT_TRUE(outline.Remove("x/y").IsNone());
    EXPECT_EQ(RowsOf(outline), Rows{"+a"});
}

TEST(KeyOutline, LastKeyTakesItsBranchesAlong)
{
    auto outline = AllOpen({"a/b/c", "d"});
    auto const change = outline.Remove("a/b/c");
    EXPECT_EQ(RowsOf(outline), Rows{"d*"});
    EXPECT_EQ(change.removed, 3U);
}

TEST(KeyOutline, BranchThatComesBackIsOpenAgain)
{
    auto outline = AllOpen({"a/b", "c"});
    outline.Remove("a/b");
    outline.Insert("a/d");
    EXPECT_EQ(RowsOf(outline), (Rows{"-a", "  d*", "c*"}));
}

TEST(KeyOutline, OtherKeysLeaveOpenWhatWasOpen)
{
    auto outline = Shown({"a/b", "c/d"});
    outline.Open(0);
    outline.Show({"e"});
    EXPECT_EQ(RowsOf(outline), Rows{"e*"});
    outline.Show({"a/x", "c/d"});
    EXPECT_EQ(RowsOf(outline), (Rows{"-a", "  x*", "+c"}));
}

TEST(KeyOutline, TooMuchThatWasOpenIsForgotten)
{
    std::vector<std::string> keys;
    for (int i = 0; i < 100'001; ++i)
        keys.push_back(std::to_string(i) + "/x");
    auto outline = AllOpen(ViewOf(keys));
    outline.Show({"a"});
    outline.Show({"0/x"});
    EXPECT_EQ(RowsOf(outline), Rows{"+0"});
}

TEST(KeyOutline, RowOfWhatIsCoveredIsNone)
{
    auto outline = Shown({"a/b/c"});
    EXPECT_EQ(outline.RowOf("a/b/c"), std::nullopt);
    EXPECT_EQ(outline.RowOf("a"), 0U);
    auto const change = outline.Reveal("a/b/c");
    EXPECT_EQ(outline.RowOf("a/b/c"), 2U);
    EXPECT_EQ(change.row, 1U);
    EXPECT_EQ(change.added, 2U);
}

TEST(KeyOutline, RevealOfNoKeyChangesNothing)
{
    auto outline = Shown({"a/b"});
    EXPECT_TRUE(outline.Reveal("a/x").IsNone());
    EXPECT_EQ(RowsOf(outline), Rows{"+a"});
}

TEST(KeyOutline, ParentIsTheBranchAbove)
{
    auto const outline = AllOpen({"a/b", "a/c/d"});
    EXPECT_EQ(outline.ParentRow(0), std::nullopt);
    EXPECT_EQ(outline.ParentRow(2), 0U);
    EXPECT_EQ(outline.ParentRow(3), 2U);
}

TEST(KeyOutline, CloseAllLeavesTheTop)
{
    auto outline = AllOpen({"a/b/c", "d"});
    outline.CloseAll();
    EXPECT_EQ(RowsOf(outline), (Rows{"+a", "d*"}));
    outline.Open(0);
    EXPECT_EQ(RowsOf(outline), (Rows{"-a", "  +b", "d*"}));
}

TEST(KeyOutline, FilterKeepsBranchesOfWhatMatches)
{
    auto outline = Shown({"a/b/Ink", "a/c", "d/Ink", "e"});
    outline.SetFilter([](std::string const& key) { return key.ends_with("Ink"); });
    EXPECT_EQ(RowsOf(outline), (Rows{"-a", "  -b", "    Ink*", "-d", "  Ink*"}));
}

TEST(KeyOutline, NoFilterShowsWhatWasOpenBefore)
{
    auto outline = Shown({"a/b", "c/d"});
    outline.Open(1);
    outline.SetFilter([](std::string const&) { return true; });
    outline.Close(2);
    EXPECT_EQ(RowsOf(outline), (Rows{"-a", "  b*", "+c"}));
    outline.SetFilter({});
    EXPECT_EQ(RowsOf(outline), (Rows{"+a", "-c", "  d*"}));
}

TEST(KeyOutline, KeyAboveAMatchStaysAKey)
{
    auto outline = Shown({"a", "a/b"});
    outline.SetFilter([](std::string const& key) { return key == "a/b"; });
    EXPECT_EQ(RowsOf(outline), (Rows{"-a*", "  b*"}));
    outline.SetFilter([](std::string const& key) { return key == "a"; });
    EXPECT_EQ(RowsOf(outline), Rows{"a*"});
}

TEST(KeyOutline, FilterAppliesToKeysThatCome)
{
    auto outline = Shown({"a"});
    outline.SetFilter([](std::string const& key) { return key != "no"; });
    EXPECT_TRUE(outline.Insert("no").IsNone());
    EXPECT_EQ(outline.Insert("yes").added, 1U);
    EXPECT_EQ(outline.KeyCount(), 3U);
    EXPECT_EQ(RowsOf(outline), (Rows{"a*", "yes*"}));
}

TEST(KeyOutline, FilterThatWantsNothingShowsNothing)
{
    auto outline = Shown({"a/b", "c"});
    outline.SetFilter([](std::string const&) { return false; });
    EXPECT_EQ(outline.RowCount(), 0U);
    EXPECT_EQ(outline.RowOf("c"), std::nullopt);
}

TEST(KeyOutline, ChangedValueIsCheckedAgain)
{
    std::set<std::string> wanted{"a/b"};
    auto outline = Shown({"a/b", "c"});
    outline.SetFilter([&wanted](std::string const& key) { return wanted.contains(key); });
    wanted = {"c"};
    EXPECT_EQ(outline.Recheck("a/b").removed, 2U);
    EXPECT_EQ(outline.Recheck("c").added, 1U);
    EXPECT_TRUE(outline.Recheck("nowhere").IsNone());
    EXPECT_EQ(RowsOf(outline), Rows{"c*"});
}

// Whatever happens, the rows told one change at a time are those of the outline, and each is found.
TEST(KeyOutline, ChangesLeadToTheRowsThatAreThere)
{
    std::mt19937 random(7);
    auto const below = [&random](std::size_t end) { return random() % end; };
    auto const anyKey = [&below]
    {
        std::string key;
        for (std::size_t size = below(6); size > 0; --size)
            key += "ab/-"[below(4)];
        return key;
    };
    KeyOutline outline;
    std::set<std::string> keys;
    Rows rows;
    for (int i = 0; i < 4000; ++i)
    {
        std::string const key = anyKey();
        std::size_t const action = below(6);
        if (action < 2)
        {
            Follow(rows, outline.Insert(key), outline);
            keys.insert(key);
        }
        else if (action == 2)
        {
            Follow(rows, outline.Remove(key), outline);
            keys.erase(key);
        }
        else if (action == 3)
            Follow(rows, outline.Reveal(key), outline);
        else if (outline.RowCount() > 0)
            Follow(rows, outline.Toggle(below(outline.RowCount())), outline);
        if (i % 800 == 400)
            outline.SetFilter([](std::string const& any) { return any.find('b') != std::string::npos; });
        if (i % 800 == 0)
            outline.SetFilter({});
        if (i % 400 == 0)
            rows = PathsOf(outline);
        ASSERT_EQ(rows, PathsOf(outline)) << "after step " << i;
        ASSERT_EQ(outline.KeyCount(), keys.size());
        if (outline.RowCount() > 0)
        {
            std::size_t const row = below(outline.RowCount());
            ASSERT_EQ(outline.RowOf(rows[row]), row);
            ASSERT_EQ(outline.RowAt(row).key.has_value(), keys.contains(rows[row]));
        }
    }
    outline.SetFilter({});
    KeyOutline fresh = AllOpen({keys.begin(), keys.end()});
    outline.OpenAll();
    EXPECT_EQ(RowsOf(outline), RowsOf(fresh));
}

TEST(KeyOutline, ManySlashesAreShownAndEnd)
{
    std::string const key(100'000, '/');
    auto outline = AllOpen({key});
    EXPECT_EQ(outline.RowCount(), 100'001U);
    EXPECT_EQ(outline.RowOf(key), 100'000U);
    EXPECT_EQ(outline.Remove(key).removed, 100'001U);
}

TEST(KeyOutline, ManyKeysAreShownAtOnce)
{
    auto const keys = ManyKeys();
    auto const view = ViewOf(keys);
    KeyOutline outline;
    ExpectWithin(std::chrono::milliseconds(5000), [&] { outline.Show(view); });
    EXPECT_EQ(outline.RowCount(), 100U);
    ExpectWithin(std::chrono::milliseconds(5000), [&] { outline.OpenAll(); });
    EXPECT_EQ(outline.RowCount(), 100'100U);
    EXPECT_EQ(outline.RowAt(100'099).key, "Branch199/Key1999");
}

TEST(KeyOutline, ManyRowsAreReadAndFoundAtOnce)
{
    auto const keys = ManyKeys();
    auto const outline = AllOpen(ViewOf(keys));
    ExpectWithin(std::chrono::milliseconds(10000),
                 [&]
                 {
                     for (std::size_t row = 0; row < outline.RowCount(); ++row)
                         ASSERT_EQ(outline.RowOf(outline.PathAt(row)), row);
                 });
}

TEST(KeyOutline, KeysComeAndGoAmongManyAtOnce)
{
    auto const keys = ManyKeys();
    auto outline = AllOpen(ViewOf(keys));
    ExpectWithin(std::chrono::milliseconds(5000),
                 [&]
                 {
                     for (int i = 0; i < 2000; ++i)
                         ASSERT_EQ(outline.Insert("Branch150/New" + std::to_string(i)).added, 1U);
                     for (int i = 0; i < 2000; ++i)
                         ASSERT_EQ(outline.Remove("Branch150/New" + std::to_string(i)).removed, 1U);
                 });
}

TEST(KeyOutline, ManyKeysWithoutABranchComeAtOnce)
{
    std::vector<std::string> keys;
    for (int i = 0; i < 100'000; ++i)
        keys.push_back(std::to_string(1'000'000 + i));
    auto outline = Shown(ViewOf(keys));
    ExpectWithin(std::chrono::milliseconds(5000),
                 [&]
                 {
                     for (int i = 0; i < 1000; ++i)
                         ASSERT_EQ(outline.Insert(std::to_string(i)).added, 1U);
                 });
    EXPECT_EQ(outline.RowCount(), 101'000U);
}
