// From a notification to the numeric id of the event by which the host hears of it.
#pragma once

#include "comgui/host/NotifData.h"
#include <optional>
#include <string>

namespace comgui::detail
{
// No id: the notification is not published. localEndPoint: UTF-8, this client's own, by which it tells
// whether a job's remote end point is meant for it.
std::optional<int> EventIdOf(NotifData const& notification, std::string const& localEndPoint);
}  // namespace comgui::detail
