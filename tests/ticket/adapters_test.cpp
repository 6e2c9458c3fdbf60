// The two adapters between single writes and table writes.
#include "comgui/ticket/MTICKET_ACCESS.h"

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
    bool tableOk = true;
    bool terminated = false;
    bool okWasClear = false;
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
    recorder->terminated = table[1].key == nullptr;
    recorder->okWasClear = !table[0].ok;
    table[0].ok = recorder->tableOk;
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
    int SetByTable()
    {
        return MSETPARAMETER_TO_MSETMULTIPAR(this, 3, 4, "k", PARAM_INT, &number, 2, SetTable);
    }

    RECORDER seen;
    int const number = 5;
};
}  // namespace

using TableByOnes = Adapter;
using OneByTable = Adapter;

TEST_F(TableByOnes, NullTable_Gives0WithoutACall)
{
    EXPECT_EQ(SetByOnes(nullptr), 0);
    EXPECT_TRUE(seen.writes.empty());
}

TEST_F(TableByOnes, TerminatorAlone_Gives1WithoutACall)
{
    SETMULTIPAR table[1] = {};
    EXPECT_EQ(SetByOnes(table), 1);
    EXPECT_TRUE(seen.writes.empty());
}

TEST_F(TableByOnes, EveryRecord_GoesOutInOrderWithAllItsFields)
{
    SETMULTIPAR table[] = {Record("a", PARAM_INT, &number, -1), Record("b", PARAM_STRING, "text", 7), {}};
    EXPECT_EQ(SetByOnes(table), 1);
    EXPECT_EQ(seen.writes, (std::vector<WRITE>{{this, 3, 4, "a", PARAM_INT, &number, -1},
                                               {this, 3, 4, "b", PARAM_STRING, table[1].value, 7}}));
    EXPECT_TRUE(table[0].ok);
    EXPECT_TRUE(table[1].ok);
}

TEST_F(TableByOnes, FailedRecord_IsMarkedAndTheRestGoesOn_TheResultStays1_ByDesign)
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

TEST_F(TableByOnes, ResultWithAClearLowestByte_CountsAsFailure_ByDesign)
{
    SETMULTIPAR table[] = {Record("a", PARAM_INT, &number, -1), {}};
    seen.results["a"] = 256;
    SetByOnes(table);
    EXPECT_FALSE(table[0].ok);
}

TEST_F(TableByOnes, AnyBitOfTheLowestByte_MakesAProperTrue)
{
    SETMULTIPAR table[] = {Record("a", PARAM_INT, &number, -1), {}};
    seen.results["a"] = -2;
    SetByOnes(table);
    EXPECT_EQ(reinterpret_cast<unsigned char const&>(table[0].ok), 1);
}

TEST_F(OneByTable, Write_GoesOutAsATableOfOneRecord)
{
    EXPECT_EQ(SetByTable(), 1);
    EXPECT_EQ(seen.writes, (std::vector<WRITE>{{this, 3, 4, "k", PARAM_INT, &number, 2}}));
    EXPECT_TRUE(seen.terminated);
    EXPECT_TRUE(seen.okWasClear);
}

TEST_F(OneByTable, SuccessWithOkLeftAt0_Gives0)
{
    seen.tableOk = false;
    EXPECT_EQ(SetByTable(), 0);
}

TEST_F(OneByTable, FailureWithOkSet_Gives0)
{
    seen.tableResult = 0;
    EXPECT_EQ(SetByTable(), 0);
}

TEST_F(OneByTable, AnyResultButZero_IsSuccess)
{
    seen.tableResult = 256;
    EXPECT_EQ(SetByTable(), 1);
}
