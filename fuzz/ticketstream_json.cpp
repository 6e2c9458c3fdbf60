// The JSON of ticketstream, both ways. Any bytes as a stream: if they can be read, what is made of their JSON
// must mean the same and have the same JSON. Any bytes as JSON: what is made of them must be a whole stream
// that means the same again by way of its own JSON.
#include "comgui/stream/MTICKET_BINSTREAM.h"
#include "comgui/stream/STICKET_BINSTREAM.h"
#include "fuzz/fuzz.h"
#include "tools/ticketstream/Trouble.h"
#include "tools/ticketstream/diff.h"
#include "tools/ticketstream/dump.h"
#include "tools/ticketstream/json.h"
#include "tools/ticketstream/make.h"
#include "tools/ticketstream/whole.h"
#include <optional>

using namespace ticketstream;

namespace
{
bool IsWhole(std::string_view stream)
{
    return IsContainer(stream) ? MTICKET_BINSTREAM::Check(stream.data(), stream.size())
                               : STICKET_BINSTREAM::Check(stream.data(), stream.size());
}

std::optional<std::string> JsonOf(std::string_view stream)
try
{
    tools::Output out;
    PrintJson(stream, out);
    return out.Text();
}
catch (BrokenStream const& broken)
{
    COMGUI_MUST(broken.Offset() < stream.size());
    return {};
}

std::optional<std::string> Made(std::string_view json)
try
{
    return MakeStream(json);
}
catch (WrongJson const&)
{
    return {};
}

void AsStream(std::string_view bytes)
{
    auto const json = JsonOf(bytes);
    COMGUI_MUST(json.has_value() == IsWhole(bytes));
    tools::Output dump;
    COMGUI_MUST(Dump(bytes, dump).has_value() == !json || IsContainer(bytes));
    if (!json)
        return;
    auto const again = Made(*json);
    COMGUI_MUST(again);
    tools::Output difference;
    COMGUI_MUST(Diff(bytes, *again, difference));
    COMGUI_MUST(JsonOf(*again) == json);
}

void AsJson(std::string_view bytes)
{
    auto const stream = Made(bytes);
    if (!stream)
        return;
    COMGUI_MUST(IsWhole(*stream));
    tools::Output difference;
    COMGUI_MUST(Diff(*stream, Made(*JsonOf(*stream)).value(), difference));
}
}  // namespace

int LLVMFuzzerTestOneInput(std::uint8_t const* data, std::size_t size)
{
    std::string_view const bytes(reinterpret_cast<char const*>(data), size);
    AsStream(bytes);
    AsJson(bytes);
    return 0;
}
