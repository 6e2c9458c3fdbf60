// Where a parser stands in the JSON of a stream: knows what may stand there, and tells the place.
#pragma once

#include <string>
#include <vector>

namespace ticketstream
{
// What a value of the document stands for.
enum class Part
{
    Document,
    Records,  // the list of a ticket stream or of an operation
    Record,
    Operations,
    Operation,
    Keys,    // a list of texts
    Bytes,   // a scalar, or an object that has bytes as hex
    Scalar,  // anything else: a number, a text, null
};

class JsonPlace
{
public:
    // The parser's events. Each throws WrongJson if the shape does not allow for it.
    void Begin(bool isArray);
    void Member(std::string const& name);
    void Scalar();

    // The object or list ends, and gives what it was; the place is still its own until Next().
    Part End();
    void Next();

    bool IsInOperation() const { return m_levels.size() > 2; }

    std::string Text() const;  // a JSON pointer

private:
    struct Level
    {
        Part part;
        bool isArray;
        unsigned long index = 0;
        char const* member = nullptr;
        unsigned int given = 0;  // a bit for each member so far
    };

    Part Expected() const;

    std::vector<Level> m_levels;
};
}  // namespace ticketstream
