// What tests of ticket files share.
#pragma once

#include "comgui/client/Snapshot.h"
#include "desk/model/FileFault.h"
#include <cmath>
#include <limits>
#include <string>

// The trouble of a result; none if it is good.
template <typename T>
std::optional<desk::FileTrouble> TroubleOf(desk::FileResult<T> const& result)
{
    auto const* const fault = std::get_if<desk::FileFault>(&result);
    return fault ? std::optional(fault->trouble) : std::nullopt;
}

template <typename T>
desk::FileFault FaultOf(desk::FileResult<T> const& result)
{
    return std::get<desk::FileFault>(result);
}

// A ticket with everything that both forms hold as it is.
inline comgui::Snapshot PlainTicket()
{
    using comgui::Bytes;
    using comgui::List;
    return comgui::Snapshot({{"A/Int", -5},
                             {"A/Largest", std::numeric_limits<int>::max()},
                             {"A/Half", 0.5},
                             {"A/Tiny", 5e-324},
                             {"A/NoNumber", std::nan("")},
                             {"A/Text", " Grün <&> \"1\" "},
                             {"A/Empty", ""},
                             {"A/NoUtf8", "\xFF\xC3(\x80"},
                             {"A/Control", "\x01\r\n\x1B"},
                             {"A/Bytes", Bytes{std::string("\0<\xFF", 3)}},
                             {"A/NoBytes", Bytes{}},
                             {"A/Int64", std::numeric_limits<long long>::min()},
                             {"A/Unsigned64", std::numeric_limits<unsigned long long>::max()},
                             {"A/List", List{{0, 1}, {1, 2}, {2, 3}}},
                             {"A/Gaps", List{{0, "first"}, {3, "fourth"}, {100000, "far"}}},
                             {"A/LateList", List{{2, 7}}},
                             {"A/Mixed", List{{0, 1}, {1, "two"}, {2, Bytes{"3"}}, {3, 4.5}}},
                             {"B/\x01\xFF\n key", 1},
                             {std::string(2000, 'k'), "long key"}});
}
