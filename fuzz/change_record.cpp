// The journal's records of changes. Any bytes: they are refused, or are the one form of a change that a
// ticket can have; then nothing shorter and nothing longer is a record. Any change: its record reads as the
// same change.
#include "standin/server/store/ChangeRecord.h"

#include "fuzz/fuzz.h"
#include <climits>
#include <optional>

using namespace standin;

namespace
{
constexpr TicketAddress Job{3, 1};

bool IsKind(int kind) { return kind == 1 || kind == 4 || kind == 5; }

std::string RecordOf(TicketChange const& change)
{
    std::string record;
    AppendChangeRecord(record, change);
    return record;
}

// Nothing if the record is refused, with a reason for a message of one line.
std::optional<TicketChange> Read(int kind, std::string_view record)
{
    try
    {
        return ReadChangeRecord(kind, Job, record);
    }
    catch (StoreError const& error)
    {
        std::string const reason = error.what();
        COMGUI_MUST(!reason.empty() && reason.find('\n') == std::string::npos);
        return std::nullopt;
    }
}

void MustBePossible(ParameterChange const& parameter)
{
    COMGUI_MUST(parameter.pos >= -1);
    TicketValue const& value = parameter.value;
    bool const isText = value.type == PARAM_STRING || value.type == PARAM_BINSTRING;
    COMGUI_MUST(value.type >= PARAM_NONE && value.type <= PARAM_UNSIGNED64);
    COMGUI_MUST(value.type != PARAM_POINTER && value.type != PARAM_COUNT);
    COMGUI_MUST((value.text != nullptr) == isText);
    bool const isShort = value.type == PARAM_INT || value.type == PARAM_UNSIGNED;
    bool const hasNoWord = isText || value.type == PARAM_NONE;
    COMGUI_MUST(value.word <= (hasNoWord ? 0 : isShort ? UINT_MAX : ULLONG_MAX));
}

bool AreEqual(ParameterChange const& left, ParameterChange const& right)
{
    return left.key == right.key && left.pos == right.pos && left.hadOthers == right.hadOthers &&
           IsSame(left.value.ToStored(), right.value.ToStored());
}

void AsRecord(int kind, std::string_view record)
{
    auto const change = Read(kind, record);
    COMGUI_MUST(!change || IsKind(kind));
    if (!change)
        return;
    COMGUI_MUST(change->kind == kind && change->address == Job);
    for (ParameterChange const& parameter : change->parameters)
        MustBePossible(parameter);
    COMGUI_MUST(RecordOf(*change) == record);
    COMGUI_MUST(!Read(kind, record.substr(0, record.size() - 1)) &&
                !Read(kind, record.substr(0, record.size() / 2)));
    COMGUI_MUST(!Read(kind, std::string(record) + '\0'));
}

ParameterChange NextParameter(INPUT& input)
{
    constexpr PARAM_TYPE types[] = {PARAM_INT,   PARAM_DOUBLE,   PARAM_STRING,     PARAM_BINSTRING,
                                    PARAM_INT64, PARAM_UNSIGNED, PARAM_UNSIGNED64, PARAM_NONE};
    ParameterChange parameter;
    auto const choice = input.Take<std::uint8_t>();
    parameter.hadOthers = (choice & 1) != 0;
    if (choice & 2)
        parameter.pos = static_cast<int>(input.Take<std::uint32_t>() >> (1 + input.Among(31)));
    // The borders of what one, two and three bytes tell the size of.
    std::size_t const more = choice & 4 ? input.Take<std::uint16_t>() % 17000 : 0;
    parameter.key = input.Bytes(input.Among(16)) + std::string(choice & 8 ? more : 0, 'k');
    PARAM_TYPE const type = types[choice >> 5];
    auto const number = input.Take<std::uint64_t>();
    if (type == PARAM_STRING || type == PARAM_BINSTRING)
        parameter.value = TicketValue::Text(type, input.Bytes(input.Among(16)) + std::string(more, 't'));
    else
        parameter.value = TicketValue::Number(type, &number);
    return parameter;
}

void AsChange(INPUT input)
{
    TicketChange change;
    change.address = Job;
    while (!input.IsEmpty() && change.parameters.size() < 200)
        change.parameters.push_back(NextParameter(input));
    auto const read = Read(change.kind, RecordOf(change));
    COMGUI_MUST(read && read->parameters.size() == change.parameters.size());
    for (std::size_t i = 0; i < change.parameters.size(); ++i)
        COMGUI_MUST(AreEqual(read->parameters[i], change.parameters[i]));
}
}  // namespace

int LLVMFuzzerTestOneInput(std::uint8_t const* data, std::size_t size)
{
    INPUT input(data, size);
    int const kind = input.Take<std::int8_t>();
    std::string const record = input.Bytes(size);
    AsRecord(kind, record);
    AsChange({data, size});
    return 0;
}
