// Events as rows.
#include "desk/model/EventLog.h"

#include <gtest/gtest.h>

using namespace desk;
using namespace comgui;
using namespace std::chrono_literals;

namespace
{
constexpr EventLog::Time Now = EventLog::Time(std::chrono::seconds(1'700'000'000));
constexpr TicketAddress Job{JobTickets, 5};

using Keys = std::vector<std::string>;

std::vector<EventRow> RowsOf(Event const& event)
{
    EventLog log;
    log.Append(event, Now);
    std::vector<EventRow> rows;
    for (std::size_t row = 0; row < log.RowCount(); ++row)
        rows.push_back(log.RowAt(row));
    return rows;
}

EventRow RowOf(Event const& event)
{
    auto const rows = RowsOf(event);
    EXPECT_EQ(rows.size(), 1U);
    return rows.at(0);
}

Event Change(std::string key, Value value = 1, TicketAddress ticket = Job)
{
    return TicketChanged{ticket, {{std::move(key), std::move(value)}}, false};
}

class Log : public testing::Test
{
protected:
    void Append(std::string const& key) { log.Append(Change(key), Now); }
    void Append(int count)
    {
        for (; count > 0; --count)
            Append(std::to_string(m_next++));
    }

    // By their keys.
    Keys Shown() const
    {
        Keys keys;
        for (std::size_t row = 0; row < log.RowCount(); ++row)
            keys.push_back(log.RowAt(row).key);
        return keys;
    }
    void FilterText(std::string const& text)
    {
        EventFilter filter;
        filter.isWanted = [text](std::string_view any) { return any.find(text) != any.npos; };
        log.SetFilter(filter);
    }
    void ExpectChanges(std::size_t gone, std::size_t came)
    {
        auto const changes = log.TakeChanges();
        EXPECT_FALSE(changes.isReset);
        EXPECT_EQ(changes.gone, gone);
        EXPECT_EQ(changes.came, came);
    }

    EventLog log{{4, 10'000, 3}};

private:
    int m_next = 0;
};
}  // namespace

TEST(EventRows, ChangedKeyHasItsValue)
{
    auto const row = RowOf(Change("Title", "a\nb"));
    EXPECT_EQ(row.kind, EventKind::KeyChanged);
    EXPECT_EQ(row.time, Now);
    EXPECT_EQ(row.type, JobTickets);
    EXPECT_EQ(row.id, 5);
    EXPECT_EQ(row.key, "Title");
    EXPECT_EQ(row.text, "a␊b");
}

TEST(EventRows, DeletedKeyHasNoValue)
{
    auto const row = RowOf(Change("Title", {}));
    EXPECT_EQ(row.kind, EventKind::KeyDeleted);
    EXPECT_EQ(row.text, "");
}

TEST(EventRows, KeyWithoutItsValueIsToBeRead)
{
    EXPECT_EQ(RowOf(TicketChanged{Job, {{"Title", std::nullopt}}, false}).kind, EventKind::KeyToRead);
}

TEST(EventRows, LargeValueIsCut)
{
    auto const row = RowOf(Change("Title", std::string(1'000'000, 'x')));
    EXPECT_LT(row.text.size(), 1000U);
    EXPECT_TRUE(row.text.ends_with("…"));
}

TEST(EventRows, WholeTicketIsOneRow)
{
    auto const row = RowOf(TicketChanged{Job, {}, true});
    EXPECT_EQ(row.kind, EventKind::TicketChanged);
    EXPECT_EQ(row.id, 5);
}

TEST(EventRows, EachKeyIsARow)
{
    auto const rows = RowsOf(TicketChanged{Job, {{"a", 1}, {"b", 2}}, true});
    ASSERT_EQ(rows.size(), 3U);
    EXPECT_EQ(rows[0].key, "a");
    EXPECT_EQ(rows[1].key, "b");
    EXPECT_EQ(rows[2].kind, EventKind::TicketChanged);
}

TEST(EventRows, ManyKeysEndWithHowManyMore)
{
    std::vector<KeyChange> keys(100'000, {"Key", 1});
    auto const rows = RowsOf(TicketChanged{Job, keys, false});
    ASSERT_EQ(rows.size(), 101U);
    EXPECT_EQ(rows[99].kind, EventKind::KeyChanged);
    EXPECT_EQ(rows[100].kind, EventKind::MoreKeys);
    EXPECT_EQ(rows[100].count, 99'900);
}

TEST(EventRows, AsManyKeysAsListedNeedNoMore)
{
    EXPECT_EQ(RowsOf(TicketChanged{Job, std::vector<KeyChange>(100, {"Key", 1}), false}).size(), 100U);
}

TEST(EventRows, TicketsComeAndGo)
{
    EXPECT_EQ(RowOf(TicketCreated{Job}).kind, EventKind::TicketCreated);
    EXPECT_EQ(RowOf(TicketDeleted{Job}).kind, EventKind::TicketDeleted);
    EXPECT_EQ(RowOf(TicketDeleted{Job}).id, 5);
}

TEST(EventRows, ManyTicketsHaveNoId)
{
    auto const row = RowOf(ManyTicketsChanged{JobTickets});
    EXPECT_EQ(row.kind, EventKind::ManyTicketsChanged);
    EXPECT_EQ(row.type, JobTickets);
    EXPECT_EQ(row.id, std::nullopt);
}

TEST(EventRows, ProgressIsInBytes)
{
    auto const row = RowOf(TransferProgressed{7, {10, 20, 0, std::nullopt}});
    EXPECT_EQ(row.kind, EventKind::TransferProgressed);
    EXPECT_EQ(row.transfer, 7);
    EXPECT_EQ(row.count, 10);
    EXPECT_EQ(row.total, 20);
    EXPECT_EQ(row.type, std::nullopt);
}

TEST(EventRows, EndedTransferHasItsJob)
{
    auto const row = RowOf(TransferEnded{7, {}, 12});
    EXPECT_EQ(row.kind, EventKind::TransferEnded);
    EXPECT_EQ(row.job, 12);
    EXPECT_EQ(row.text, "");
}

TEST(EventRows, FailedTransferSaysWhy)
{
    auto const row = RowOf(TransferEnded{7, Error{NoSuchFile, "/a\n", ""}, std::nullopt});
    EXPECT_EQ(row.kind, EventKind::TransferFailed);
    EXPECT_NE(row.text.find("/a␊"), std::string::npos);
}

TEST(EventRows, LostServerSaysWhy)
{
    auto const row = RowOf(ServerLost{{ServerAway, "host", "gone"}});
    EXPECT_EQ(row.kind, EventKind::ServerLost);
    EXPECT_NE(row.text.find("gone"), std::string::npos);
}

TEST(EventRows, ServerComesBackWithTheOldOrANewSession)
{
    EXPECT_EQ(RowOf(ServerBack{false}).kind, EventKind::ServerBack);
    EXPECT_EQ(RowOf(ServerBack{true}).kind, EventKind::ServerBackAnew);
}

TEST_F(Log, OldestRowsGo)
{
    Append(6);
    EXPECT_EQ(Shown(), (Keys{"2", "3", "4", "5"}));
    EXPECT_EQ(log.AllRows(), 4U);
}

TEST_F(Log, RowsOfLargeTextsGoEarlier)
{
    Append("a");
    Append(std::string(5000, 'x'));
    Append(std::string(5001, 'y'));
    EXPECT_EQ(Shown(), Keys{std::string(5001, 'y')});
    Append(std::string(1'000'000, 'z'));
    EXPECT_EQ(log.RowCount(), 1U);
    Append("b");
    EXPECT_EQ(Shown(), Keys{"b"});
}

TEST_F(Log, PausedOneStandsStill)
{
    Append(4);
    log.Pause();
    Append(3);
    EXPECT_EQ(Shown(), (Keys{"0", "1", "2", "3"}));
    EXPECT_EQ(log.CameMeanwhile(), 3U);
}

TEST_F(Log, ResumedOneShowsWhatCame)
{
    Append(4);
    log.TakeChanges();
    log.Pause();
    Append(3);
    ExpectChanges(0, 0);
    log.Resume();
    EXPECT_EQ(Shown(), (Keys{"3", "4", "5", "6"}));
    EXPECT_EQ(log.CameMeanwhile(), 0U);
    ExpectChanges(3, 3);
}

TEST_F(Log, MoreThanItHoldsMayComeInAPause)
{
    log.Pause();
    Append(10);
    EXPECT_EQ(log.CameMeanwhile(), 10U);
    log.Resume();
    EXPECT_EQ(Shown(), (Keys{"6", "7", "8", "9"}));
}

TEST_F(Log, ChangesAreToldOnce)
{
    Append(3);
    ExpectChanges(0, 3);
    ExpectChanges(0, 0);
    Append(2);
    ExpectChanges(1, 2);
}

TEST_F(Log, RowsThatCameAndWentAreNotTold)
{
    Append(2);
    ExpectChanges(0, 2);
    Append(10);
    ExpectChanges(2, 4);
}

TEST_F(Log, TextFilterLooksAtKeyAndValue)
{
    FilterText("Ink");
    log.Append(Change("Ink/Cyan"), Now);
    log.Append(Change("Title", "Inky"), Now);
    log.Append(Change("Title", "Other"), Now);
    EXPECT_EQ(Shown(), (Keys{"Ink/Cyan", "Title"}));
    EXPECT_EQ(log.AllRows(), 3U);
}

TEST_F(Log, NewFilterLooksAtAllRows)
{
    for (char const* const key : {"a", "b", "ab"})
        Append(key);
    FilterText("a");
    EXPECT_EQ(Shown(), (Keys{"a", "ab"}));
    EXPECT_TRUE(log.TakeChanges().isReset);
    FilterText("b");
    EXPECT_EQ(Shown(), (Keys{"b", "ab"}));
    log.SetFilter({});
    EXPECT_EQ(Shown(), (Keys{"a", "b", "ab"}));
}

TEST_F(Log, FilteredRowsGoWithTheOldest)
{
    FilterText("a");
    for (char const* const key : {"a1", "b", "a2", "b"})
        Append(key);
    log.TakeChanges();
    Append("b");
    EXPECT_EQ(Shown(), Keys{"a2"});
    ExpectChanges(1, 0);
    Append("a3");
    ExpectChanges(0, 1);
    EXPECT_EQ(Shown(), (Keys{"a2", "a3"}));
}

TEST_F(Log, TicketFilterKeepsWhatMayConcernIt)
{
    EventFilter filter;
    filter.ticket = Job;
    log.SetFilter(filter);
    log.Append(TicketCreated{Job}, Now);
    log.Append(TicketCreated{{JobTickets, 6}}, Now);
    log.Append(ManyTicketsChanged{JobTickets}, Now);
    log.Append(ManyTicketsChanged{QueueTickets}, Now);
    ASSERT_EQ(log.RowCount(), 2U);
    EXPECT_EQ(log.RowAt(0).kind, EventKind::TicketCreated);
    EXPECT_EQ(log.RowAt(1).kind, EventKind::ManyTicketsChanged);
}

TEST_F(Log, ClearedOneGoesOn)
{
    Append(3);
    log.Pause();
    Append(1);
    log.Clear();
    EXPECT_EQ(log.RowCount(), 0U);
    EXPECT_EQ(log.CameMeanwhile(), 0U);
    EXPECT_TRUE(log.TakeChanges().isReset);
    log.Resume();
    Append(1);
    EXPECT_EQ(Shown(), Keys{"4"});
    ExpectChanges(0, 1);
}

TEST(ManyEvents, FillTheRingAtOnce)
{
    EventLog log;
    EventFilter filter;
    filter.isWanted = [](std::string_view text) { return text.ends_with('7'); };
    log.SetFilter(filter);
    for (int i = 0; i < 250'000; ++i)
        log.Append(Change("Key" + std::to_string(i), "x"), Now);
    EXPECT_EQ(log.AllRows(), 100'000U);
    ASSERT_EQ(log.RowCount(), 10'000U);
    EXPECT_EQ(log.RowAt(0).key, "Key150007");
    EXPECT_EQ(log.RowAt(9999).key, "Key249997");
}

TEST_F(Log, ARowKeepsItsNumber_UntilItIsNotShown)
{
    Append(4);
    std::size_t const number = log.NumberOf(2);
    Append(1);  // the oldest goes
    EXPECT_EQ(log.IndexOf(number), 1U);
    FilterText("2");
    EXPECT_EQ(log.IndexOf(number), 0U);
    FilterText("3");
    EXPECT_EQ(log.IndexOf(number), std::nullopt);
}
