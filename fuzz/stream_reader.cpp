// The reader of ticket streams on any bytes. Check must foretell its answer. What it read, also before an
// error, must be writable, and what was written must be read in full and not change any more.
#include "comgui/stream/STICKET_BINSTREAM.h"
#include "comgui/ticket/SETMULTIPAR_LIST.h"
#include "fuzz/fuzz.h"

namespace
{
std::string Written(SETMULTIPAR_LIST& list)
{
    std::string stream = "untouched";
    STICKET_BINSTREAM::Write(stream, list.Table(false), 0);
    for (SETMULTIPAR const* record = list.Table(false); record && record->key; ++record)
        COMGUI_MUST(record->ok);
    return stream;
}

std::string Rewritten(std::string const& stream, bool fixPositions)
{
    SETMULTIPAR_LIST list(false);
    COMGUI_MUST(STICKET_BINSTREAM::Check(stream.data(), stream.size()));
    COMGUI_MUST(STICKET_BINSTREAM::Read(list, stream.data(), stream.size(), fixPositions));
    return Written(list);
}

void MustReachAFixedPoint(std::uint8_t const* data, std::size_t size, bool fixPositions)
{
    SETMULTIPAR_LIST list(false);
    bool const isRead = STICKET_BINSTREAM::Read(list, data, size, fixPositions);
    COMGUI_MUST(isRead == STICKET_BINSTREAM::Check(data, size));
    std::string const once = Written(list);
    std::string const twice = Rewritten(once, fixPositions);
    // A first value whose key is empty has no key item and is read under the key "STICKET_1", once.
    bool const hasKey = list.Size() == 0 || list.Table(false)->key[0] != '\0';
    COMGUI_MUST((twice == once) == hasKey);
    COMGUI_MUST(Rewritten(twice, fixPositions) == twice);
}
}  // namespace

int LLVMFuzzerTestOneInput(std::uint8_t const* data, std::size_t size)
{
    MustReachAFixedPoint(data, size, false);
    MustReachAFixedPoint(data, size, true);
    return 0;
}
