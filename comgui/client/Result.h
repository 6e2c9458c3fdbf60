// The outcome of a call: a value, or an Error. For one thread at a time, like any value.
#pragma once

#include "comgui/client/Error.h"
#include <optional>
#include <utility>
#include <variant>

namespace comgui
{
template <typename T>
class [[nodiscard]] Result
{
public:
    Result(T value) : m_outcome(std::in_place_index<0>, std::move(value)) {}
    Result(Error error) : m_outcome(std::in_place_index<1>, std::move(error)) {}

    bool IsGood() const noexcept { return m_outcome.index() == 0; }
    explicit operator bool() const noexcept { return IsGood(); }

    // Throws std::bad_variant_access after a failure.
    T& operator*() & { return std::get<0>(m_outcome); }
    T const& operator*() const& { return std::get<0>(m_outcome); }
    T operator*() && { return std::get<0>(std::move(m_outcome)); }  // a value, which a loop over it keeps
    T* operator->() { return &**this; }
    T const* operator->() const { return &**this; }

    T ValueOr(T other) const& { return IsGood() ? std::get<0>(m_outcome) : std::move(other); }
    T ValueOr(T other) && { return std::move(IsGood() ? std::get<0>(m_outcome) : other); }

    // Throws std::bad_variant_access after a success.
    Error const& GetError() const { return std::get<1>(m_outcome); }

private:
    std::variant<T, Error> m_outcome;
};

// The outcome of a call that has no value to give.
template <>
class [[nodiscard]] Result<void>
{
public:
    Result() = default;
    Result(Error error) : m_error(std::move(error)) {}

    bool IsGood() const noexcept { return !m_error; }
    explicit operator bool() const noexcept { return IsGood(); }

    // Throws std::bad_optional_access after a success.
    Error const& GetError() const { return m_error.value(); }

private:
    std::optional<Error> m_error;
};

using Outcome = Result<void>;
}  // namespace comgui
