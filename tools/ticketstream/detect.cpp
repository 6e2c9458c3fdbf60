#include "tools/ticketstream/detect.h"

#include "comgui/stream/MTICKET_BINSTREAM.h"

namespace ticketstream
{
Kind Detect(std::string_view beginning)
{
    if (beginning.empty())
        return {"empty", true};
    switch (MTICKET_BINSTREAM::Detect(beginning.data(), beginning.size()))
    {
    case 1:
        return {"single-ticket stream", true};
    case 2:
        return {"container stream", true};
    default:
        return {"neither kind of ticket stream", false};
    }
}
}  // namespace ticketstream
