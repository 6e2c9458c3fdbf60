#include "comgui/session/NotificationEvents.h"

#include <algorithm>
#include <climits>
#include <iterator>

namespace comgui::detail
{
namespace
{
using FILTER = std::optional<int> (*)(NotifData const& notification, std::string const& localEndPoint);

struct EVENT_RULE
{
    int kind;
    int code;
    int id;
    FILTER filter = nullptr;  // decides in the place of id
};

constexpr int AnyCode = INT_MIN;
constexpr int JobParameterChanged = 1000004;
constexpr int OwnRemoteEndPoint = 1000101;

// Jobs name the client that they belong to; the others have no use for that word.
std::optional<int> RemoteEndPointFilter(NotifData const& notification, std::string const& localEndPoint)
{
    if (notification.NotifKey != "Job/Identification/RemoteEndpoint")
        return JobParameterChanged;
    if (notification.NotifText.IsSameAs(wxString::FromUTF8(localEndPoint.c_str()), false))
        return OwnRemoteEndPoint;
    return std::nullopt;
}

// What is not here is not published. Hosts know these numbers; two of them have a digit more, and keep it.
constexpr EVENT_RULE Rules[] = {
    {1, 0, 1000044},
    {1, 2, 1000200},
    {1, 3, JobParameterChanged, RemoteEndPointFilter},
    {1, 5, 1000034},
    {1, 6, 1000024},
    {1, 7, 1000034},
    {1, 12, 1000094},
    {1, 17, 1000014},
    {4, 2, 1000226},
    {4, 3, 1000002},
    {4, 7, 1000036},
    {4, 17, 1000012},
    {5, 2, 1000225},
    {5, 3, 1000003},
    {5, 7, 1000035},
    {5, 12, 1000093},
    {5, 17, 1000013},
    {6, AnyCode, 10000015},
    {9, AnyCode, 10000110},
    {11, AnyCode, OwnRemoteEndPoint},
};
}  // namespace

std::optional<int> EventIdOf(NotifData const& notification, std::string const& localEndPoint)
{
    auto const* const rule =
        std::find_if(std::begin(Rules), std::end(Rules),
                     [&](EVENT_RULE const& candidate)
                     {
                         return candidate.kind == notification.NotifKind &&
                                (candidate.code == AnyCode || candidate.code == notification.NotifCode);
                     });
    if (rule == std::end(Rules))
        return std::nullopt;
    return rule->filter ? rule->filter(notification, localEndPoint) : rule->id;
}
}  // namespace comgui::detail
