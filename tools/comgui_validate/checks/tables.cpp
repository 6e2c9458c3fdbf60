#include "tools/comgui_validate/checks/values.h"

#include <cstring>

namespace validate
{
namespace
{
// As a careless host might leave it: ok is no bool yet.
template <typename Record>
void SoilOk(Record& record)
{
    unsigned char const byte = 0x5A;
    std::memcpy(&record.ok, &byte, sizeof byte);
}

template <typename Record>
void ExpectOk(Subject& ticket, char const* rule, Record const& record, bool due)
{
    unsigned char byte = 0;
    std::memcpy(&byte, &record.ok, sizeof byte);
    ticket.GetTrial().Expect(rule, byte == (due ? 1 : 0),
                             "ok " + std::to_string(byte) + " in the record of " + Quoted(record.key),
                             due ? "1" : "0");
}

void WriteAndLook(Subject& ticket)
{
    std::string const names[] = {Key("T1"), Key("T2"), Key("T3")};
    Value const values[] = {Int(1), Text("two"), Double(3)};
    WrittenWord const words[] = {WrittenWord(values[0]), WrittenWord(values[1]), WrittenWord(values[2])};
    SETMULTIPAR table[4]{};
    for (int i = 0; i < 3; ++i)
        table[i] = ToWrite(names[i], words[i], values[i].type, -1);
    SETMULTIPAR before[4];
    std::memcpy(before, table, sizeof before);
    ticket.WriteTable(table);
    for (int i = 0; i < 3; ++i)
    {
        ExpectOk(ticket, "T2", table[i], true);
        table[i].ok = false;
        ticket.GetTrial().Expect("T6", std::memcmp(&table[i], &before[i], sizeof before[i]) == 0,
                                 "a record with other fields", "the record, but for ok");
    }
    for (int i = 0; i < 3; ++i)
        ticket.ExpectValue("T1", names[i], values[i]);
}

// The third record fails: PARAM_COUNT cannot be written.
void GoesOn(Subject& ticket)
{
    std::string const names[] = {Key("T1"), Key("T2"), Key("T3"), Key("T4")};
    Value const value = Int(7);
    WrittenWord const word(value);
    SETMULTIPAR table[5]{};
    for (int i = 0; i < 4; ++i)
        table[i] = ToWrite(names[i], word, i == 2 ? PARAM_COUNT : PARAM_INT, -1);
    ticket.WriteTable(table);
    ticket.ExpectValue("T1", names[0], value);
    ticket.ExpectValue("T1", names[1], value);
    ticket.ExpectValue("T1", names[3], value);
}

void OkOfWrites(Subject& ticket)
{
    std::string const names[] = {Key("T1"), Key("T2"), Key("T3")};
    Value const value = Int(7);
    WrittenWord const word(value);
    SETMULTIPAR table[4]{};
    for (int i = 0; i < 3; ++i)
    {
        table[i] = ToWrite(names[i], word, i == 1 ? PARAM_COUNT : PARAM_INT, -1);
        SoilOk(table[i]);
    }
    ticket.WriteTable(table);
    for (int i = 0; i < 3; ++i)
        ExpectOk(ticket, "T2", table[i], i != 1);
}

void OkOfReads(Subject& ticket)
{
    std::string const names[] = {Key("T1"), Key("Missing"), Key("T3")};
    ticket.ExpectWrite("V2", names[0], Int(1));
    ticket.ExpectWrite("V2", names[2], Int(3));
    ReadPlace places[3];
    GETMULTIPAR table[4]{};
    for (int i = 0; i < 3; ++i)
    {
        table[i] = ToRead(names[i], PARAM_INT, places[i], -1);
        SoilOk(table[i]);
    }
    ticket.ReadTable(table);
    Trial& trial = ticket.GetTrial();
    for (int i = 0; i < 3; ++i)
        ExpectOk(ticket, "T2", table[i], i != 1);
    trial.Expect("T3", places[1].IsUntouched(), "a change at the place of the record that failed",
                 "an untouched place");
    for (int i : {0, 2})
    {
        trial.Expect("T6", places[i].IsUntouchedBehind(PARAM_INT), "a change behind the place of the value",
                     "no more than its width");
        auto const read = places[i].As(PARAM_INT);
        trial.Expect("T1", read == Int(i + 1), Shown(read), Shown(Int(i + 1)));
    }
}

void TextsTogether(Subject& ticket)
{
    constexpr int Count = 20;
    std::vector<std::string> names, texts;
    for (int i = 0; i < Count; ++i)
    {
        names.push_back(Key("Text" + std::to_string(i)));
        texts.push_back(std::string(100, static_cast<char>('a' + i)));
        ticket.ExpectWrite("V2", names.back(), Text(texts.back()));
    }
    std::vector<ReadPlace> places(Count);
    std::vector<GETMULTIPAR> table;
    for (std::size_t i = 0; i < Count; ++i)
        table.push_back(ToRead(names[i], PARAM_STRING, places[i], -1));
    table.push_back({});
    ticket.ReadTable(table.data());
    std::vector<std::string> const churn(1000, std::string(100, '#'));
    for (std::size_t i = 0; i < Count; ++i)
    {
        auto const read = table[i].ok ? places[i].As(PARAM_STRING) : std::nullopt;
        ticket.GetTrial().Expect("T4", read == Text(texts[i]), Shown(read), Shown(Text(texts[i])));
    }
}

void List(Subject& ticket)
{
    std::string const key = Key("List");
    ticket.ExpectWrite("V2", key, Text("what was there before"));
    Value const values[] = {Int(10), Int(11), Int(12)};
    WrittenWord const words[] = {WrittenWord(values[0]), WrittenWord(values[1]), WrittenWord(values[2])};
    SETMULTIPAR writes[4]{};
    for (int i = 0; i < 3; ++i)
        writes[i] = ToWrite(key, words[i], PARAM_INT, i == 0 ? -1 : i);
    ticket.WriteTable(writes);
    ReadPlace places[3];
    GETMULTIPAR reads[4]{};
    for (int i = 0; i < 3; ++i)
        reads[i] = ToRead(key, PARAM_INT, places[i], i);
    ticket.ReadTable(reads);
    for (int i = 0; i < 3; ++i)
    {
        auto const read = reads[i].ok ? places[i].As(PARAM_INT) : std::nullopt;
        ticket.GetTrial().Expect("T5", read == values[i], Shown(read), Shown(values[i]));
    }
    ticket.ExpectNothing("T5", key, PARAM_INT, 3);
}

// What stands behind the null key must not matter.
void Empty(Subject& ticket)
{
    Value const value = Int(7);
    WrittenWord const word(value);
    std::string const key = Key("Behind");
    SETMULTIPAR writes[3]{};
    writes[0].type = PARAM_INT;
    writes[0].value = word.Get();
    writes[1] = ToWrite(key, word, PARAM_INT, -1);
    ticket.WriteTable(writes);
    ticket.ExpectNothing("T7", key, PARAM_INT);
    GETMULTIPAR reads[1]{};
    ticket.ReadTable(reads);
}

void KeepsNothing(Subject& ticket)
{
    std::string key = Key("Kept");
    std::string const written = key;
    Value value = Text("what was written");
    {
        WrittenWord const word(value);
        SETMULTIPAR table[2]{};
        table[0] = ToWrite(key, word, PARAM_STRING, -1);
        ticket.WriteTable(table);
        std::memset(static_cast<void*>(table), 0x5A, sizeof table);
    }
    std::fill(value.bytes.begin(), value.bytes.end(), 'x');
    std::fill(key.begin(), key.end(), 'x');
    ticket.ExpectValue("G2", written, Text("what was written"));
}
}  // namespace

std::vector<NamedSubjectCheck> const& SubjectChecksOfTables()
{
    static std::vector<NamedSubjectCheck> const checks{
        {"write", WriteAndLook},
        {"goes-on", GoesOn},
        {"ok-of-writes", OkOfWrites},
        {"ok-of-reads", OkOfReads},
        {"texts-together", TextsTogether},
        {"list", List},
        {"empty", Empty},
        {"keeps-nothing", KeepsNothing},
    };
    return checks;
}

std::vector<Check> TableChecks() { return InAContainer("tables", SubjectChecksOfTables()); }
}  // namespace validate
