// What every target shares: its entry point, the word for an oracle, and the taking apart of its input.
#pragma once

#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <string>

// Called once for each input, by libFuzzer or by replay.cpp.
extern "C" int LLVMFuzzerTestOneInput(std::uint8_t const* data, std::size_t size);

// Ends the program when the oracle says no, in every kind of build.
#define COMGUI_MUST(condition)                                                                               \
    ((condition)                                                                                             \
         ? void()                                                                                            \
         : (std::fprintf(stderr, "%s:%d: not so: %s\n", __FILE__, __LINE__, #condition), std::abort()))

// The input as a row of choices. Behind its end all choices are 0.
class INPUT
{
public:
    INPUT(std::uint8_t const* data, std::size_t size) : m_next(data), m_left(size) {}

    bool IsEmpty() const { return m_left == 0; }

    template <typename T>
    T Take()
    {
        T value{};
        std::size_t const size = sizeof value < m_left ? sizeof value : m_left;
        std::memcpy(&value, m_next, size);
        Skip(size);
        return value;
    }

    // That many bytes, or as many as there are.
    std::string Bytes(std::size_t size)
    {
        std::string const bytes(reinterpret_cast<char const*>(m_next), size < m_left ? size : m_left);
        Skip(bytes.size());
        return bytes;
    }

private:
    void Skip(std::size_t size)
    {
        m_next += size;
        m_left -= size;
    }

    std::uint8_t const* m_next;
    std::size_t m_left;
};
