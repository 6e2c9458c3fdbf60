// Random writes to the server and to a plain map side by side: whatever can be read must be equal.
#include "tests/server/ServerTest.h"

#include "comgui/testing/ContainerFake.h"
#include <climits>
#include <deque>
#include <random>

using comgui::test::ContainerFake;

namespace
{
char const* const Keys[] = {"A", "B", "Job/Name",
                            "a rather long key that no short string optimisation takes"};

// One random record with a value that lives as long as this does.
struct WRITE
{
    SETMULTIPAR record{};
    std::string text;
    long long number = 0;
    BIN_STRING bytes;

    WRITE(std::mt19937& random, bool pointers)
    {
        auto const among = [&](int from, int to) { return std::uniform_int_distribution(from, to)(random); };
        record.key = Keys[among(0, 3)];
        record.type = static_cast<PARAM_TYPE>(among(-1, 10));
        if (record.type == PARAM_POINTER && !pointers)
            record.type = PARAM_INT64;
        if (among(0, 3) == 0)
            record.type = PARAM_NONE;
        record.pos = among(-3, 6);
        if (among(0, 30) == 0)
            record.pos = standin::LargestPosition + among(-1, 1);
        text.assign(static_cast<std::size_t>(among(0, 40)), static_cast<char>(among('a', 'z')));
        number = std::uniform_int_distribution<long long>(LLONG_MIN, LLONG_MAX)(random);
        bytes.assign(text);
        if (record.type == PARAM_STRING)
            record.value = text.c_str();
        else if (record.type == PARAM_BINSTRING)
            record.value = &bytes;
        else if (record.type != PARAM_NONE || among(0, 20) == 0)
            record.value = &number;
        if (among(0, 40) == 0)
            record.value = nullptr;
    }
    WRITE(WRITE const&) = delete;
    WRITE& operator=(WRITE const&) = delete;
};

union WORD
{
    unsigned char bytes[16];
    char const* text;
    BIN_STRING binary;

    WORD() : bytes{} {}
};

std::string Shown(bool found, PARAM_TYPE type, WORD const& word)
{
    if (!found)
        return "-";
    if (type == PARAM_STRING)
        return word.text;
    if (type == PARAM_BINSTRING)
        return {static_cast<char const*>(word.binary.data), word.binary.size};
    return {reinterpret_cast<char const*>(word.bytes), 8};
}
}  // namespace

class TicketModel : public ServerTest, public testing::WithParamInterface<unsigned>
{
protected:
    TicketModel() { model.AddTicket(Job.type, Job.id); }

    void ExpectEqual()
    {
        for (char const* const key : Keys)
            for (int type = -1; type <= 10; ++type)
                for (int pos = -2; pos <= 8; ++pos)
                    ExpectEqual(key, static_cast<PARAM_TYPE>(type), pos);
    }
    void ExpectEqual(char const* key, PARAM_TYPE type, int pos)
    {
        WORD ours;
        WORD models;
        bool const found = Get(As("admin"), Job, key, type, &ours, pos);
        bool const expected = model.Read(Job.type, Job.id, key, type, &models, pos);
        ASSERT_EQ(Shown(found, type, ours), Shown(expected, type, models))
            << key << ' ' << type << ' ' << pos;
    }

    // The same table to both.
    void WriteBoth(bool pointers)
    {
        std::deque<WRITE> writes;
        std::vector<SETMULTIPAR> table;
        auto const count = std::uniform_int_distribution(0, 6)(random);
        for (int i = 0; i < count; ++i)
            table.push_back(writes.emplace_back(random, pointers).record);
        table.emplace_back();
        auto expected = table;
        auto const* const access = model.Access();
        EXPECT_EQ(SetTable(As("admin"), Job, table.data()),
                  access->MSETMULTIPAR(access->Instance, Job.type, Job.id, expected.data()) != 0);
        for (std::size_t i = 0; i < writes.size(); ++i)
            ASSERT_EQ(table[i].ok, expected[i].ok) << "type " << table[i].type << " pos " << table[i].pos;
    }

    ContainerFake model;
    std::mt19937 random{GetParam()};
};

TEST_P(TicketModel, RandomTables_LeaveWhatAPlainMapHolds)
{
    for (int round = 0; round < 200 && !HasFatalFailure(); ++round)
    {
        WriteBoth(true);
        ExpectEqual();
    }
}

TEST_P(TicketModel, RandomTables_AreStillThereAfterARestart)
{
    for (int round = 0; round < 100 && !HasFatalFailure(); ++round)
    {
        WriteBoth(false);
        WriteBoth(false);
        Restart();
        ExpectEqual();
    }
}

INSTANTIATE_TEST_SUITE_P(Seeds, TicketModel, testing::Values(1u, 2u, 3u, 4u, 5u));
