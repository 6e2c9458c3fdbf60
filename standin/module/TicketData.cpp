#include "standin/module/TicketData.h"

#include "standin/module/ModuleCodes.h"
#include "standin/server/tickets/TicketXml.h"
#include <cstring>
#include <limits>

namespace standin
{
int CopyTicketData(Container const& container, TicketAddress address, int format, int* size, void* buffer)
{
    if (!size)
        return MODULE_INVALID_ARGUMENT;
    if (format != TicketDataXml)
        return MODULE_UNKNOWN_FORMAT;
    std::string text;
    bool const exists =
        container.Server().Tickets().Look(container.Session(), address, 0,
                                          [&](TicketSnapshot const& ticket, KeyFilter const* limit)
                                          {
                                              text = TicketXml::Of(address, ticket, limit).Text();
                                              return true;
                                          });
    if (!exists)
        return MODULE_UNKNOWN_TICKET;
    if (text.size() > static_cast<std::size_t>(std::numeric_limits<int>::max()))
        return MODULE_FAILED;  // the size has no room in an int
    int const room = buffer ? *size : 0;
    *size = static_cast<int>(text.size());
    if (!buffer || room < *size)
        return MODULE_BUFFER_TOO_SMALL;
    std::memcpy(buffer, text.data(), text.size());
    return MODULE_DONE;
}
}  // namespace standin
