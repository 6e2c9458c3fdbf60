#include "tests/module/ModelStep.h"

#include "tests/module/ValueText.h"
#include <cstdio>

namespace
{
// A pointer is its own word, whatever it points at.
void const* AsPointer(long long number) { return reinterpret_cast<void const*>(number); }

char const* NameOf(ACTION action)
{
    static constexpr char const* Names[] = {
        "log in",  "log out",     "read",        "read table",  "write",       "write table",
        "open",    "close",       "create",      "create next", "delete",      "limit",
        "operate", "who am I",    "ticket data", "walk",        "walk values", "register",
        "enable",  "disable",     "hold",        "release",     "flood",       "put",
        "get",     "prepare job", "send job",    "open file",   "close file"};
    return Names[static_cast<int>(action)];
}

std::string Printable(std::string const& text)
{
    std::string shown;
    for (char const byte : text.substr(0, 60))
    {
        char code[5];
        std::snprintf(code, sizeof code, "\\x%02X", static_cast<unsigned char>(byte));
        bool const isPlain = byte >= 0x20 && byte != 0x7F;
        shown += isPlain ? std::string(1, byte) : std::string(code);
    }
    return text.size() > 60 ? shown + "... of " + std::to_string(text.size()) + " bytes" : shown;
}

std::string LineOf(MODEL_RECORD const& record, bool isWrite)
{
    std::string const line = (record.key ? "\"" + Printable(*record.key) + "\"" : "null") + "@" +
                             std::to_string(record.pos) + " type " + std::to_string(record.type);
    if (record.isNull)
        return line + " null";
    return isWrite ? line + " " + Printable(TextOf(record.type, VALUE_WORD(record).Get())) : line;
}

bool HasKeys(ACTION action)
{
    return action == ACTION::Create || action == ACTION::Limit || action == ACTION::Enable;
}

bool IsWalk(ACTION action) { return action == ACTION::WalkTickets || action == ACTION::WalkValues; }
}  // namespace

VALUE_WORD::VALUE_WORD(MODEL_RECORD const& record)
    : m_double(static_cast<double>(record.number) / 8.0), m_word(&record.number)
{
    m_binary.assign(record.text);
    if (record.type == PARAM_DOUBLE)
        m_word = &m_double;
    else if (record.type == PARAM_STRING)
        m_word = record.text.c_str();
    else if (record.type == PARAM_BINSTRING)
        m_word = &m_binary;
    else if (record.type == PARAM_POINTER)
        m_word = AsPointer(record.number);
    if (record.isNull)
        m_word = nullptr;
}

std::string LineOf(STEP const& step)
{
    std::string const who = step.session == STEP::Files ? "file" : "session " + std::to_string(step.session);
    std::string line =
        who + ": " + NameOf(step.action) + " " + std::to_string(step.type) + "/" + std::to_string(step.id);
    if (step.table != STEP::Container)
        line += " table " + std::to_string(step.table);
    bool const isWrite = step.action == ACTION::Write || step.action == ACTION::WriteTable;
    for (MODEL_RECORD const& record : step.records)
        line += ", " + LineOf(record, isWrite);
    if (step.isNullTable)
        line += ", null table";
    if (HasKeys(step.action))
        for (std::string const& key : step.keys)
            line += " \"" + key + "\"";
    if (!step.source.empty() || !step.target.empty())
        line += " \"" + step.source + "\" \"" + step.target + "\"";
    if (step.number)
        line += " number " + std::to_string(step.number);
    if (step.stop)
        line += " stop " + std::to_string(step.stop);
    if (IsWalk(step.action) && step.during)
        line += ", around the next " + std::to_string(step.during);
    return line;
}
