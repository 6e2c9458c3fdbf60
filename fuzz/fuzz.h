// What every target shares: its entry point, the word for an oracle, and the taking apart of its input.
#pragma once

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <string>
#include <unistd.h>

// Called once for each input, by libFuzzer or by replay.cpp.
extern "C" int LLVMFuzzerTestOneInput(std::uint8_t const* data, std::size_t size);

// stderr as it was at the start: the fuzzer closes the stream, to which the server reports what it refuses.
inline int const OracleOutput = dup(STDERR_FILENO);

[[noreturn]] inline void OracleSaysNo(char const* file, int line, char const* condition)
{
    dprintf(OracleOutput, "%s:%d: not so: %s\n", file, line, condition);
    std::abort();
}

// Ends the program when the oracle says no, in every kind of build.
#define COMGUI_MUST(condition) ((condition) ? void() : OracleSaysNo(__FILE__, __LINE__, #condition))

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
        if (size)  // the input may be null
            std::memcpy(&value, m_next, size);
        Skip(size);
        return value;
    }

    // A choice among that many, the first is 0.
    unsigned Among(unsigned count) { return Take<std::uint8_t>() % count; }

    // That many bytes, or as many as there are.
    std::string Bytes(std::size_t size)
    {
        std::string const bytes(reinterpret_cast<char const*>(m_next), size < m_left ? size : m_left);
        Skip(bytes.size());
        return bytes;
    }

    // The same as a C text: a zero byte becomes another one.
    std::string Text(std::size_t size)
    {
        std::string text = Bytes(size);
        std::replace(text.begin(), text.end(), '\0', '0');
        return text;
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
