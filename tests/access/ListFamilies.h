// The lists and variants of the two families of views, and the templates below them, under one interface.
#pragma once

#include "comgui/access/list_templates.h"
#include "tests/access/Families.h"
#include <limits>
#include <type_traits>
#include <vector>

using comgui::test::CALL;
using comgui::test::SLOT;

// A ticket of either family. Where a list is concerned the key is always "k".
template <typename Family>
class LISTS : public Family
{
public:
    template <typename List>
    bool GetVector(List& out)
    {
        return this->OnRead([](auto const& view, auto&&... rest) { return view.GetVectorParameter(rest...); },
                            "k", out);
    }
    template <typename T>
    bool GetArray(T* out, unsigned long count)
    {
        return this->OnRead([](auto const& view, auto&&... rest) { return view.GetArrayParameter(rest...); },
                            "k", out, count);
    }
    template <typename Array>
    bool GetWxArray(Array& out)
    {
        return this->OnRead(
            [](auto const& view, auto&&... rest) { return view.GetWxArrayParameter(rest...); }, "k", out);
    }
    bool GetVariantChk(wxVariant& value, int pos, char const* key = "k")
    {
        return this->OnRead([](auto const& view, auto&&... rest)
                            { return view.GetWxVariantParameterChk(rest...); },
                            key, value, pos);
    }
    wxVariant GetVariantDef(wxVariant const& def, int pos)
    {
        return this->OnRead([](auto const& view, auto&&... rest)
                            { return view.GetWxVariantParameterDef(rest...); },
                            def, pos);
    }

    template <typename List>
    bool SetVector(List const& in)
    {
        return this->OnModify(
            [](auto const& view, auto&&... rest) { return view.SetVectorParameter(rest...); }, "k", in);
    }
    template <typename T>
    bool SetArray(T const* in, unsigned long count)
    {
        return this->OnModify(
            [](auto const& view, auto&&... rest) { return view.SetArrayParameter(rest...); }, "k", in, count);
    }
    template <typename Array>
    bool SetWxArray(Array const& in)
    {
        return this->OnModify(
            [](auto const& view, auto&&... rest) { return view.SetWxArrayParameter(rest...); }, "k", in);
    }
    bool SetVariant(wxVariant const& value, int pos)
    {
        return this->OnModify([](auto const& view, auto&&... rest)
                              { return view.SetWxVariantParameter(rest...); },
                              "k", value, pos);
    }

    template <typename T>
    bool xGetVector(std::vector<T>& out)
    {
        return this->OnRecord([](auto const& record, auto&&... rest)
                              { return xGetVectorParameter(record, rest...); },
                              "k", out);
    }
    template <typename T>
    bool xGetArray(T* out, unsigned long count)
    {
        return this->OnRecord([](auto const& record, auto&&... rest)
                              { return xGetArrayParameter(record, rest...); },
                              "k", out, count);
    }
    // The form of the template that the element type has.
    template <typename T>
    bool xSetVector(std::vector<T> const& in)
    {
        return this->OnRecord(
            [](auto const& record, auto&&... rest)
            {
                if constexpr (std::is_pointer_v<T>)
                    return xpSetVectorParameter(record, rest...);
                else
                    return xSetVectorParameter(record, rest...);
            },
            "k", in);
    }
    template <typename T>
    bool xSetArray(T const* in, unsigned long count)
    {
        return this->OnRecord(
            [](auto const& record, auto&&... rest)
            {
                if constexpr (std::is_pointer_v<T>)
                    return xpSetArrayParameter(record, rest...);
                else
                    return xSetArrayParameter(record, rest...);
            },
            "k", in, count);
    }

    // Stores a value without a trace in the calls.
    void Store(char const* text, int pos) { this->fake.Put(Family::Type, Family::Id, "k", text, pos); }
    template <typename T>
    void Store(T value, int pos)
    {
        if constexpr (std::is_pointer_v<T>)
            this->fake.Put(Family::Type, Family::Id, "k", GetParamType<T>(), value, pos);
        else
            this->fake.Put(Family::Type, Family::Id, "k", GetParamType<T>(), &value, pos);
    }
    template <typename T>
    void StoreList(std::vector<T> const& values)
    {
        for (std::size_t i = 0; i < values.size(); ++i)
            Store(values[i], i == 0 ? -1 : static_cast<int>(i));
    }

    unsigned long Count() { return this->fake.Count(Family::Type, Family::Id, "k"); }
    std::optional<std::string> Text(int pos) { return this->fake.Text(Family::Type, Family::Id, "k", pos); }

    // What a slot gets in its calls.
    static CALL Get(PARAM_TYPE type, int pos)
    {
        return {SLOT::GET, Family::Type, Family::Id, "k", type, pos};
    }
    static CALL Set(PARAM_TYPE type, int pos)
    {
        return {SLOT::SET, Family::Type, Family::Id, "k", type, pos};
    }
    static CALL GetTable() { return {SLOT::GETTABLE, Family::Type, Family::Id}; }
    static CALL SetTable() { return {SLOT::SETTABLE, Family::Type, Family::Id}; }
    static CALL Delete() { return Set(PARAM_NONE, -1); }
};

template <typename Family>
class ListsInBothFamilies : public testing::Test
{
protected:
    LISTS<Family> ticket;
    std::vector<CALL>& calls = ticket.fake.calls;
};

// Six values of an element type, the ends of its range among them.
template <typename T>
std::vector<T> SomeValues()
{
    using LIMITS = std::numeric_limits<T>;
    return {T(10), T(20), LIMITS::lowest(), LIMITS::max(), T(0), LIMITS::min()};
}
template <>
inline std::vector<void*> SomeValues<void*>()
{
    static char bytes[6];
    return {bytes, bytes + 1, bytes + 2, bytes + 3, nullptr, bytes + 5};
}
template <typename T>
std::vector<T> SomeValues(std::size_t count)
{
    std::vector<T> values = SomeValues<T>();
    values.resize(count);
    return values;
}
