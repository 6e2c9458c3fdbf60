#include "tools/comgui_validate/checks/values.h"

#include "tools/comgui_validate/Session.h"
#include <climits>
#include <cstring>
#include <limits>

namespace validate
{
namespace
{
void MissingKey(Subject& ticket)
{
    for (Value const& value : OneOfEachType())
        ticket.ExpectNothing("V1", Key("Missing"), value.type);
    ticket.ExpectNothing("V1", Key("Missing"), PARAM_NONE);
}

// Three values, as the library writes a list of them.
void WriteList(Subject& ticket, std::string const& key)
{
    ticket.ExpectWrite("V2", key, Int(10));
    ticket.ExpectWrite("V5", key, Int(11), 1);
    ticket.ExpectWrite("V5", key, Int(12), 2);
}

void PastTheEnd(Subject& ticket)
{
    WriteList(ticket, Key("List"));
    for (int const position : {3, 4, 1000, INT_MAX})
        ticket.ExpectNothing("V1", Key("List"), PARAM_INT, position);
}

void EachType(Subject& ticket) { ExpectEachTypeBack(ticket, false); }

void Limits(Subject& ticket)
{
    using Numbers = std::numeric_limits<double>;
    for (Value const& value :
         {Int(INT_MIN), Int(INT_MAX), Int(0), Int64(LLONG_MIN), Int64(LLONG_MAX), Unsigned(UINT_MAX),
          Unsigned64(ULLONG_MAX), Double(Numbers::max()), Double(Numbers::denorm_min()), Double(-0.0),
          Double(Numbers::infinity()), Double(-Numbers::infinity())})
    {
        ticket.ExpectWrite("V2", Key("Limit"), value);
        ticket.ExpectValue("V2", Key("Limit"), value);
    }
}

void StartsAnew(Subject& ticket)
{
    WriteList(ticket, Key("List"));
    ticket.ExpectWrite("V3", Key("List"), Text("alone"));
    ticket.ExpectValue("V3", Key("List"), Text("alone"));
    ticket.ExpectNothing("V3", Key("List"), PARAM_INT, 1);
    ticket.ExpectNothing("V3", Key("List"), PARAM_INT, 2);
}

void Position0(Subject& ticket)
{
    ticket.ExpectWrite("V4", Key("Alone"), Int(42));
    ticket.ExpectValue("V4", Key("Alone"), Int(42), 0);
    ticket.ExpectValue("V4", Key("Alone"), Int(42), -1);
}

void OneOfAList(Subject& ticket)
{
    WriteList(ticket, Key("List"));
    ticket.ExpectWrite("V5", Key("List"), Int(99), 1);
    ticket.ExpectValue("V5", Key("List"), Int(10), 0);
    ticket.ExpectValue("V5", Key("List"), Int(99), 1);
    ticket.ExpectValue("V5", Key("List"), Int(12), 2);
}

void ExpectType(Subject& ticket, std::string const& key, int position, PARAM_TYPE due)
{
    auto const type = ticket.Read(key, PARAM_NONE, position);
    int number = -1;
    if (type)
        std::memcpy(&number, type->bytes.data(), sizeof number);
    ticket.GetTrial().Expect("V7", number == due,
                             type ? NameOf(static_cast<PARAM_TYPE>(number)) : std::string("0"), NameOf(due));
}

void Type(Subject& ticket)
{
    for (Value const& value : OneOfEachType())
        if (value.type != PARAM_POINTER)
        {
            ticket.ExpectWrite("V2", Key("Typed"), value);
            ExpectType(ticket, Key("Typed"), -1, value.type);
            ExpectType(ticket, Key("Typed"), 0, value.type);
        }
    WriteList(ticket, Key("List"));
    ExpectType(ticket, Key("List"), -1, PARAM_COUNT);
    ExpectType(ticket, Key("List"), 0, PARAM_INT);
}

void ExpectCount(Subject& ticket, char const* rule, std::string const& key, unsigned long due)
{
    auto const read = ticket.Read(key, PARAM_COUNT);
    unsigned long count = 0;
    if (read)
        std::memcpy(&count, read->bytes.data(), sizeof count);
    ticket.GetTrial().Expect(rule, count == due, read ? std::to_string(count) : "0, a failure",
                             std::to_string(due));
}

void Count(Subject& ticket)
{
    ticket.ExpectWrite("V2", Key("Alone"), Int(1));
    ExpectCount(ticket, "V8", Key("Alone"), 1);
    WriteList(ticket, Key("List"));
    ExpectCount(ticket, "V8", Key("List"), 3);
    ExpectCount(ticket, "V8", Key("Missing"), 0);
}

void DeleteKey(Subject& ticket)
{
    WriteList(ticket, Key("List"));
    ticket.GetTrial().ExpectSuccess("V9", ticket.Delete(Key("List")));
    for (int const position : {-1, 0, 1, 2})
        ticket.ExpectNothing("V9", Key("List"), PARAM_INT, position);
    ExpectCount(ticket, "V9", Key("List"), 0);
}

void DeleteOne(Subject& ticket)
{
    WriteList(ticket, Key("List"));
    ticket.GetTrial().ExpectSuccess("V9", ticket.Delete(Key("List"), 2));
    ticket.ExpectNothing("V9", Key("List"), PARAM_INT, 2);
    ticket.ExpectValue("V9", Key("List"), Int(10), 0);
    ticket.ExpectValue("V9", Key("List"), Int(11), 1);
}

void Texts(Subject& ticket)
{
    for (char const* const text :
         {"", " ", "plain", "gr\xC3\xBC\xC3\x9F", "\xE8\xAA\x9E", "\xF0\x9F\x96\xA8", "two\nlines\tand a tab",
          "\"quoted\" & <marked>", "$(TEMP)/x", "'; DROP TABLE tickets; --"})
    {
        ticket.ExpectWrite("V10", Key("Text"), Text(text));
        ticket.ExpectValue("V10", Key("Text"), Text(text));
    }
}

void LongText(Subject& ticket)
{
    for (std::size_t const length : {127U, 128U, 255U, 256U, 4096U, 65536U, 1048576U})
    {
        ticket.ExpectWrite("V10", Key("Text"), Text(std::string(length, 'x')));
        ticket.ExpectValue("V10", Key("Text"), Text(std::string(length, 'x')));
    }
}

void BytesOfAnyKind(Subject& ticket)
{
    std::string every;
    for (int i = 0; i < 256; ++i)
        every.push_back(static_cast<char>(i));
    for (std::string const& bytes :
         {std::string(1, '\0'), std::string("\0\0a", 3), every, std::string(100'000, '\0')})
    {
        ticket.ExpectWrite("V11", Key("Bytes"), Bytes(bytes));
        ticket.ExpectValue("V11", Key("Bytes"), Bytes(bytes));
    }
}

// Long enough for memory of its own, which is given to others once it is free.
void TextsStay(Subject& ticket)
{
    std::string const first(200, 'a');
    ticket.ExpectWrite("V2", Key("Text"), Text(first));
    GETMULTIPAR record[2]{};
    char const* text = nullptr;
    std::string const key = Key("Text");
    record[0] = {key.c_str(), PARAM_STRING, 0, &text, -1, false, {}};
    ticket.ReadTable(record);
    std::vector<std::string> const churn(1000, std::string(200, 'b'));
    ticket.GetTrial().Expect("V12", text && first == text, text ? Quoted(text) : std::string("null"),
                             Quoted(first));
}

void CountIsReadOnly(Subject& ticket)
{
    WriteList(ticket, Key("List"));
    unsigned long one = 1;
    std::string const key = Key("List");
    SETMULTIPAR record[2]{};
    record[0] = {key.c_str(), PARAM_COUNT, 0, &one, -1, false, {}};
    ticket.WriteTable(record);
    ExpectCount(ticket, "V13", key, 3);
    ticket.ExpectValue("V13", key, Int(12), 2);
}

void Keys(Subject& ticket)
{
    std::vector<std::string> const names{Key("A"),  Key("a"),   Key("A/B"),
                                         Key("A/"), Key("A B"), Key("gr\xC3\xBC\xC3\x9F")};
    for (std::size_t i = 0; i < names.size(); ++i)
        ticket.ExpectWrite("V14", names[i], Int(static_cast<int>(i)));
    for (std::size_t i = 0; i < names.size(); ++i)
        ticket.ExpectValue("V14", names[i], Int(static_cast<int>(i)));
}

void KeepsNothing(Subject& ticket)
{
    std::string key = Key("Kept");
    Value value = Text("what was written");
    std::string const written = key;
    ticket.ExpectWrite("G2", key, value);
    std::fill(value.bytes.begin(), value.bytes.end(), 'x');
    std::fill(key.begin(), key.end(), 'x');
    ticket.ExpectValue("G2", written, Text("what was written"));
    Value number = Int(5);
    ticket.ExpectWrite("G2", written, number);
    number = Int(6);
    ticket.ExpectValue("G2", written, Int(5));
    Value bytes = Bytes("bytes");
    ticket.ExpectWrite("G2", written, bytes);
    std::fill(bytes.bytes.begin(), bytes.bytes.end(), 'x');
    ticket.ExpectValue("G2", written, Bytes("bytes"));
}

// That they return is all that is asked.
void OddKeys(Subject& ticket)
{
    for (std::string const& key :
         {std::string(), std::string(100'000, 'k'), std::string("\x01\x7F"), std::string("\xFF\xFE"),
          std::string("/"), std::string("//"), std::string("%s%n"), std::string("$(")})
    {
        (void)ticket.Read(key, PARAM_INT);
        (void)ticket.Write(key, Int(1));
        (void)ticket.Read(key, PARAM_INT);
        (void)ticket.Delete(key);
    }
}

void OddPositions(Subject& ticket)
{
    ticket.ExpectWrite("V2", Key("Alone"), Int(1));
    for (int const position : {-2, -3, -1000, INT_MIN, INT_MAX})
        (void)ticket.Read(Key("Alone"), PARAM_INT, position);
    for (int const position : {-3, -1000, INT_MIN})
    {
        (void)ticket.Write(Key("Alone"), Int(2), position);
        (void)ticket.Delete(Key("Alone"), position);
    }
}
}  // namespace

void ExpectEachTypeBack(Subject& ticket, bool hasPointers)
{
    for (Value const& value : OneOfEachType())
        if (value.type != PARAM_POINTER || hasPointers)
        {
            std::string const key = Key(NameOf(value.type));
            ticket.ExpectWrite("V2", key, value);
            ticket.ExpectValue("V2", key, value);
        }
    for (Value const& value : OneOfEachType())  // those that were written first are still there
        if (value.type != PARAM_POINTER || hasPointers)
            ticket.ExpectValue("V2", Key(NameOf(value.type)), value);
}

void Append(Subject& ticket)
{
    for (int i = 0; i < 4; ++i)
        ticket.ExpectWrite("V6", Key("Grown"), Text(std::to_string(i)), -2);
    for (int i = 0; i < 4; ++i)
        ticket.ExpectValue("V6", Key("Grown"), Text(std::to_string(i)), i);
    ticket.ExpectNothing("V6", Key("Grown"), PARAM_STRING, 4);
}

std::vector<NamedSubjectCheck> const& SubjectChecksOfValues()
{
    static std::vector<NamedSubjectCheck> const checks{
        {"missing-key", MissingKey},
        {"past-the-end", PastTheEnd},
        {"each-type", EachType},
        {"limits", Limits},
        {"starts-anew", StartsAnew},
        {"position-0", Position0},
        {"one-of-a-list", OneOfAList},
        {"append", Append},
        {"type", Type},
        {"count", Count},
        {"delete", DeleteKey},
        {"delete-one", DeleteOne},
        {"texts", Texts},
        {"long-text", LongText},
        {"bytes", BytesOfAnyKind},
        {"texts-stay", TextsStay},
        {"count-is-read-only", CountIsReadOnly},
        {"keys", Keys},
        {"keeps-nothing", KeepsNothing},
        {"odd-keys", OddKeys},
        {"odd-positions", OddPositions},
    };
    return checks;
}

std::vector<Check> InAContainer(char const* group, std::vector<NamedSubjectCheck> const& checks)
{
    static std::vector<std::unique_ptr<std::string>> names;  // a Check only points at its name
    std::vector<Check> all;
    for (NamedSubjectCheck const& check : checks)
    {
        names.push_back(std::make_unique<std::string>(std::string(group) + "." + check.name));
        all.push_back({names.back()->c_str(), [run = check.run](Trial& trial)
                       {
                           Session session(trial);
                           ScratchTicket const ticket(session);
                           InContainer subject(trial, session.Container(), ticket.Type(), ticket.Id());
                           run(subject);
                       }});
    }
    return all;
}

std::vector<Check> ValueChecks() { return InAContainer("values", SubjectChecksOfValues()); }
}  // namespace validate
