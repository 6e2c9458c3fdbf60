#include "tools/ticketstream/diff.h"

#include "comgui/stream/STICKET_BINSTREAM.h"
#include "comgui/ticket/SETMULTIPAR_LIST.h"
#include "comgui/ticket/TICKET_OP.h"
#include "tools/ticketstream/OperationWalk.h"
#include "tools/ticketstream/Trouble.h"
#include "tools/ticketstream/text.h"
#include "tools/ticketstream/whole.h"
#include <algorithm>
#include <bit>
#include <cstring>
#include <span>

namespace ticketstream
{
using tools::Colour;
using tools::Output;

namespace
{
using Records = std::span<SETMULTIPAR const>;

// The records as the reader gives them, sorted by key; those of one key stay in their order.
class SortedRecords
{
public:
    explicit SortedRecords(std::string_view stream)
    {
        if (!STICKET_BINSTREAM::Read(m_list, stream.data(), stream.size(), false))
            throw std::bad_alloc();  // it was seen to be whole
        m_left = Records(m_list.Table(true), m_list.Size());
    }

    char const* NextKey() const { return m_left.empty() ? nullptr : m_left.front().key; }

    // The records of the next key if it is this one, else none.
    Records Take(char const* key)
    {
        auto const end =
            std::find_if(m_left.begin(), m_left.end(),
                         [key](SETMULTIPAR const& record) { return std::strcmp(record.key, key) != 0; });
        Records const taken = m_left.first(static_cast<std::size_t>(end - m_left.begin()));
        m_left = m_left.subspan(taken.size());
        return taken;
    }

private:
    SETMULTIPAR_LIST m_list{false};
    Records m_left;
};

Value ValueOf(SETMULTIPAR const& record)
{
    Value value;
    value.type = record.type;
    switch (record.type)
    {
    case PARAM_INT:
        value.integer = *static_cast<int const*>(record.value);
        break;
    case PARAM_INT64:
        value.integer = *static_cast<long long const*>(record.value);
        break;
    case PARAM_UNSIGNED64:
        value.unsigned64 = *static_cast<unsigned long long const*>(record.value);
        break;
    case PARAM_DOUBLE:
        value.number = *static_cast<double const*>(record.value);
        break;
    case PARAM_STRING:
        value.bytes = static_cast<char const*>(record.value);
        break;
    case PARAM_BINSTRING:
    {
        auto const& bytes = *static_cast<BIN_STRING const*>(record.value);
        if (bytes.valid())
            value.bytes.assign(static_cast<char const*>(bytes.data), bytes.size);
        break;
    }
    default:
        break;
    }
    return value;
}

std::string LineOf(SETMULTIPAR const& record)
{
    std::string const value = Shown(ValueOf(record));
    return Shown(record.key) + "  " + TypeName(record.type) + "  " + std::to_string(record.pos) +
           (value.empty() ? "" : "  ") + value;
}

bool IsSame(SETMULTIPAR const& left, SETMULTIPAR const& right)
{
    if (left.type != right.type || left.pos != right.pos)
        return false;
    Value const ofLeft = ValueOf(left);
    Value const ofRight = ValueOf(right);
    // By bits: 0.0 and -0.0 are two numbers, and NaN is one.
    return ofLeft.integer == ofRight.integer && ofLeft.unsigned64 == ofRight.unsigned64 &&
           std::bit_cast<unsigned long long>(ofLeft.number) ==
               std::bit_cast<unsigned long long>(ofRight.number) &&
           ofLeft.bytes == ofRight.bytes;
}

class Differ
{
public:
    explicit Differ(Output& out) : m_out(out) {}

    bool isSame = true;

    void Tickets(std::string_view left, std::string_view right)
    {
        SortedRecords ofLeft(left);
        SortedRecords ofRight(right);
        while (ofLeft.NextKey() || ofRight.NextKey())
        {
            char const* const key = First(ofLeft.NextKey(), ofRight.NextKey());
            Values(ofLeft.Take(key), ofRight.Take(key));
        }
    }

    void Containers(std::string_view left, std::string_view right)
    {
        OperationWalk ofLeft(left);
        OperationWalk ofRight(right);
        for (unsigned long number = 1;; ++number)
        {
            bool const hasLeft = !left.empty() && ofLeft.Next();
            bool const hasRight = !right.empty() && ofRight.Next();
            if (!hasLeft && !hasRight)
                return;
            m_title = "operation " + std::to_string(number) + '\n';
            Operations(hasLeft ? &ofLeft.Current() : nullptr, hasRight ? &ofRight.Current() : nullptr);
        }
    }

private:
    static char const* First(char const* left, char const* right)
    {
        if (!left || !right)
            return left ? left : right;
        return std::strcmp(left, right) < 0 ? left : right;
    }

    // What both have in front and at the end is the same; what stands between is told.
    void Values(Records left, Records right)
    {
        while (!left.empty() && !right.empty() && IsSame(left.front(), right.front()))
        {
            left = left.subspan(1);
            right = right.subspan(1);
        }
        while (!left.empty() && !right.empty() && IsSame(left.back(), right.back()))
        {
            left = left.first(left.size() - 1);
            right = right.first(right.size() - 1);
        }
        for (SETMULTIPAR const& record : left)
            Tell('-', LineOf(record));
        for (SETMULTIPAR const& record : right)
            Tell('+', LineOf(record));
    }

    void Operations(Operation const* left, Operation const* right)
    {
        std::string const headOfLeft = left ? Head(*left) : "";
        std::string const headOfRight = right ? Head(*right) : "";
        if (headOfLeft != headOfRight)
        {
            if (left)
                Tell('-', headOfLeft);
            if (right)
                Tell('+', headOfRight);
        }
        if (!left || !right)
            return;
        Payloads(*left, *right);
    }

    // What the payloads of other codes mean is between the one who wrote them and the module.
    void Payloads(Operation const& left, Operation const& right)
    {
        if (left.payload == right.payload)
            return;
        if (left.code == right.code && left.code == STICKET_OP_SET_MULTIPAR)
            return Tickets(left.payload, right.payload);
        if (left.code == right.code && left.code == STICKET_OP_SET_PARTIAL)
            return Keys(left.payload, right.payload);
        Tell('-', "payload " + ShownBytes(left.payload));
        Tell('+', "payload " + ShownBytes(right.payload));
    }

    void Keys(std::string_view left, std::string_view right)
    {
        std::string const ofLeft = KeyLine(left);
        std::string const ofRight = KeyLine(right);
        if (ofLeft == ofRight)
            return;
        Tell('-', ofLeft);
        Tell('+', ofRight);
    }

    static std::string KeyLine(std::string_view payload)
    {
        std::string line = "keys";
        auto const texts = TextsOf(payload);
        for (std::size_t i = 1; i < texts.size(); ++i)
            line += ' ' + Shown(texts[i].text);
        return line;
    }

    static std::string Head(Operation const& operation)
    {
        return "ticket " + std::to_string(operation.ticketType) + '/' + std::to_string(operation.ticketId) +
               "  code " + std::to_string(operation.code);
    }

    void Tell(char sign, std::string const& line)
    {
        isSame = false;
        m_out.Add(m_title);
        m_title.clear();
        m_out.Add(m_out.Painted(sign == '-' ? Colour::Removed : Colour::Added, sign + (' ' + line)) + '\n');
    }

    Output& m_out;
    std::string m_title;  // of what comes next, until it was printed
};
}  // namespace

bool Diff(std::string_view left, std::string_view right, Output& out)
{
    MustBeWhole(left);
    MustBeWhole(right);
    bool const isContainer = IsContainer(left) || IsContainer(right);
    Differ differ(out);
    if (!isContainer)
        differ.Tickets(left, right);
    else if ((left.empty() || IsContainer(left)) && (right.empty() || IsContainer(right)))
        differ.Containers(left, right);
    else
    {
        out.Add(IsContainer(left) ? "a container stream and a single-ticket stream\n"
                                  : "a single-ticket stream and a container stream\n");
        return false;
    }
    return differ.isSame;
}
}  // namespace ticketstream
