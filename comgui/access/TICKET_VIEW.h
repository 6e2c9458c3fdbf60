// What makes a class a view of an access record: it has no data, and its `this` is the record's address. So
// the pointer that a module hands out serves as any of the record's views, with no object between.
#pragma once

#include <type_traits>

namespace comgui::detail
{
template <typename View, typename Record>
class TICKET_VIEW
{
public:
    // The one place where a record turns into a view of it. Null stays null.
    static View const* Of(Record const* record)
    {
        static_assert(std::is_empty_v<View> && std::is_standard_layout_v<View>);
        return reinterpret_cast<View const*>(record);
    }

protected:
    // And the one place where it turns back.
    Record const* Access() const { return reinterpret_cast<Record const*>(this); }
};
}  // namespace comgui::detail
