// The two adapters between single writes and table writes.
#include "comgui/ticket/MTICKET_ACCESS.h"

#include <cstring>
#include <gtest/gtest.h>
#include <map>
#include <string>
#include <vector>

namespace
{
struct WRITE
{
    void* instance;
    int type;
    int id;
    std::string key;
    PARAM_TYPE ptype;
    void const* value;
    int pos;

    bool operator==(WRITE const&) const = default;
};

// Both slots at once, with what they saw and what they shall answer.
struct RECORDER
{
    std::vector<WRITE> writes;
    std::map<std::string, int> results;  // of single writes, by key; 1 where nothing stands
    int tableResult = 1;
    unsigned char tableOk = 1;  // any byte, as a module may leave it
    SETMULTIPAR table[2];
};

RECORDER* recorder;

int SetOne(void* instance, int type, int id, char const* key, PARAM_TYPE ptype, void const* value, int pos)
{
    recorder->writes.push_back({instance, type, id, key, ptype, value, pos});
    auto const result = recorder->results.find(key);
    return result == recorder->results.end() ? 1 : result->second;
}

int SetTable(void* instance, int type, int id, SETMULTIPAR* table)
{
    recorder->writes.push_back(
        {instance, type, id, table[0].key, table[0].type, table[0].value, table[0].pos});
    std::memcpy(recorder->table, table, sizeof recorder->table);
    std::memcpy(&table[0].ok, &recorder->tableOk, 1);
    return recorder->tableResult;
}

SETMULTIPAR Record(char const* key, PARAM_TYPE type, void const* value, int pos)
{
    SETMULTIPAR record = {};
    record.key = key;
    record.type = type;
    record.value = value;
    record.pos = pos;
    return record;
}

class Adapter : public testing::Test
{
protected:
    Adapter() { recorder = &seen; }

    int SetByOnes(SETMULTIPAR* table) { return MSETMULTIPAR_TO_MSETPARAMETER(this, 3, 4, table, SetOne); }
    int SetByTable(int pos = 2)
    {
        return MSETPARAMETER_TO_MSETMULTIPAR(this, 3, 4, "k", PARAM_INT, &number, pos, SetTable);
    }

    RECORDER seen = {};
    int const number = 5;
};
}  // namespace

using Adapter_MSETMULTIPAR_TO_MSETPARAMETER = Adapter;
using Adapter_MSETPARAMETER_TO_MSETMULTIPAR = Adapter;

TEST_F(Adapter_MSETMULTIPAR_TO_MSETPARAMETER, NullTable_Gives0WithoutACall)
{
    EXPECT_EQ(SetByOnes(nullptr), 0);
    EXPECT_TRUE(seen.writes.empty());
}

TEST_F(Adapter_MSETMULTIPAR_TO_MSETPARAMETER, TerminatorAlone_Gives1WithoutACall)
{
    SETMULTIPAR table[1] = {};
    EXPECT_EQ(SetByOnes(table), 1);
    EXPECT_TRUE(seen.writes.empty());
}

TEST_F(Adapter_MSETMULTIPAR_TO_MSETPARAMETER, EveryRecord_GoesOutInOrderWithAllItsFields)
{
    SETMULTIPAR table[] = {Record("a", PARAM_INT, &number, -1),
                           Record("b", PARAM_STRING, "text", 7),
                           Record("b", PARAM_NONE, nullptr, -2),
                           {}};
    EXPECT_EQ(SetByOnes(table), 1);
    EXPECT_EQ(seen.writes, (std::vector<WRITE>{{this, 3, 4, "a", PARAM_INT, &number, -1},
                                               {this, 3, 4, "b", PARAM_STRING, table[1].value, 7},
                                               {this, 3, 4, "b", PARAM_NONE, nullptr, -2}}));
    EXPECT_TRUE(table[0].ok);
    EXPECT_TRUE(table[1].ok);
    EXPECT_TRUE(table[2].ok);
}

TEST_F(Adapter_MSETMULTIPAR_TO_MSETPARAMETER, FailedRecord_IsMarkedAndTheRestGoesOn_TheResultStays1_ByDesign)
{
    SETMULTIPAR table[] = {Record("a", PARAM_INT, &number, -1),
                           Record("bad", PARAM_INT, &number, -1),
                           Record("c", PARAM_INT, &number, -1),
                           {}};
    table[1].ok = true;
    seen.results["bad"] = 0;
    EXPECT_EQ(SetByOnes(table), 1);
    EXPECT_TRUE(table[0].ok);
    EXPECT_FALSE(table[1].ok);
    EXPECT_TRUE(table[2].ok);
}

TEST_F(Adapter_MSETMULTIPAR_TO_MSETPARAMETER, ResultWithAClearLowestByte_CountsAsFailure_ByDesign)
{
    SETMULTIPAR table[] = {Record("a", PARAM_INT, &number, -1), {}};
    seen.results["a"] = 256;
    SetByOnes(table);
    EXPECT_FALSE(table[0].ok);
}

TEST_F(Adapter_MSETMULTIPAR_TO_MSETPARAMETER, AnyBitOfTheLowestByte_MakesAProperTrue)
{
    SETMULTIPAR table[] = {Record("a", PARAM_INT, &number, -1), {}};
    seen.results["a"] = -2;
    SetByOnes(table);
    EXPECT_EQ(reinterpret_cast<unsigned char const&>(table[0].ok), 1);
}

TEST_F(Adapter_MSETPARAMETER_TO_MSETMULTIPAR, Write_GoesOutAsATableOfOneRecordAndZeros)
{
    EXPECT_EQ(SetByTable(-2), 1);
    EXPECT_EQ(seen.writes, (std::vector<WRITE>{{this, 3, 4, "k", PARAM_INT, &number, -2}}));
    SETMULTIPAR const expected[2] = {Record(seen.table[0].key, PARAM_INT, &number, -2), {}};
    EXPECT_EQ(std::memcmp(seen.table, expected, sizeof expected), 0);
}

TEST_F(Adapter_MSETPARAMETER_TO_MSETMULTIPAR, SuccessWithOkLeftAt0_Gives0)
{
    seen.tableOk = 0;
    EXPECT_EQ(SetByTable(), 0);
}

TEST_F(Adapter_MSETPARAMETER_TO_MSETMULTIPAR, FailureWithOkSet_Gives0)
{
    seen.tableResult = 0;
    EXPECT_EQ(SetByTable(), 0);
}

TEST_F(Adapter_MSETPARAMETER_TO_MSETMULTIPAR, AnyResultAndAnyOkButZero_AreSuccess)
{
    for (int const result : {1, 256, -2})
        for (int const ok : {1, 2, 0xFE})
        {
            seen.tableResult = result;
            seen.tableOk = static_cast<unsigned char>(ok);
            EXPECT_EQ(SetByTable(), 1) << result << ", ok " << ok;
        }
}
