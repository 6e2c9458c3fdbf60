#include "tests/module/RandomHistory.h"

#include "comgui/ticket/TICKET_ID.h"
#include "tests/module/ModelFiles.h"
#include <iterator>
#include <random>

namespace
{
constexpr int LargestPosition = 0xFFFFFF;
constexpr int LargestTicketId = 0xFFFFFF;

// How often each action comes, among all of them together.
struct SHARE
{
    ACTION action;
    int share;
};
constexpr SHARE Shares[] = {
    {ACTION::LogIn, 60},      {ACTION::LogOut, 6},      {ACTION::Read, 120},     {ACTION::ReadTable, 60},
    {ACTION::Write, 200},     {ACTION::WriteTable, 80}, {ACTION::Open, 60},      {ACTION::Close, 50},
    {ACTION::Create, 60},     {ACTION::CreateNext, 25}, {ACTION::Delete, 50},    {ACTION::Limit, 20},
    {ACTION::Operate, 4},     {ACTION::WhoAmI, 20},     {ACTION::TicketData, 8}, {ACTION::WalkTickets, 20},
    {ACTION::WalkValues, 25}, {ACTION::Register, 15},   {ACTION::Enable, 50},    {ACTION::Disable, 20},
    {ACTION::Hold, 10},       {ACTION::Release, 10},    {ACTION::Flood, 1},      {ACTION::Put, 12},
    {ACTION::Get, 12},        {ACTION::PrepareJob, 14}, {ACTION::SendJob, 12},   {ACTION::OpenFile, 15},
    {ACTION::CloseFile, 10}};

class DRAWING
{
public:
    explicit DRAWING(unsigned seed) : m_random(seed) {}

    STEP Step()
    {
        STEP step;
        step.action = Action();
        step.session = Session(step.action);
        step.type = Type();
        step.id = Id();
        step.table = step.session == STEP::Files ? Among(0, 2) : OneIn(2) ? STEP::Container : Among(0, 9);
        Arguments(step);
        return step;
    }

private:
    int Among(int from, int to)  // both included
    {
        return from + static_cast<int>(m_random() % static_cast<unsigned>(to - from + 1));
    }
    bool OneIn(int chances) { return Among(1, chances) == 1; }
    template <typename Range>
    auto const& Of(Range const& range)
    {
        return *std::next(std::begin(range), Among(0, static_cast<int>(std::size(range)) - 1));
    }

    ACTION Action()
    {
        int sum = 0;
        for (SHARE const& share : Shares)
            sum += share.share;
        int drawn = Among(1, sum);
        auto share = std::begin(Shares);
        while ((drawn -= share->share) > 0)
            ++share;
        return share->action;
    }

    int Session(ACTION action)
    {
        bool const isOfFiles = action == ACTION::OpenFile || action == ACTION::CloseFile;
        bool const mayBeOfFiles = action == ACTION::Read || action == ACTION::ReadTable ||
                                  action == ACTION::Write || action == ACTION::WriteTable ||
                                  action == ACTION::WalkValues || action == ACTION::WhoAmI;
        if (isOfFiles || (mayBeOfFiles && OneIn(6)))
            return STEP::Files;
        bool const isOfProgram = action == ACTION::Hold || action == ACTION::Release;
        return isOfProgram ? 0 : Among(0, STEP::Sessions - 1);
    }

    int Type()
    {
        static constexpr int Types[] = {3, 3, 3, 3, 3, 3, 7, 7, 7, 7, 17, 17, 0};
        static constexpr int Others[] = {-1, 100};
        return OneIn(40) ? Of(Others) : Of(Types);
    }

    int Id()
    {
        static constexpr int Ids[] = {0, 1, 1, 1, 1, 1, 1, 1, 2, 2, 2, 2, 3, 5};
        static constexpr int Others[] = {LargestTicketId - 1, LargestTicketId, -1, LargestTicketId + 1};
        return OneIn(20) ? Of(Others) : Of(Ids);
    }

    std::string Key()
    {
        static char const* const Keys[] = {"A",
                                           "A",
                                           "B",
                                           "B",
                                           "Job/State",
                                           "Job/Copies",
                                           "a",
                                           "\xC3\x84 <&>",
                                           "a rather long key that lies on the heap"};
        return OneIn(60) ? "" : Of(Keys);
    }

    std::vector<std::string> Patterns()
    {
        static char const* const Some[] = {"A", "B", "Job/*", "a*", "A*", "*", "J*", "Job/State"};
        std::vector<std::string> patterns;
        for (int count = OneIn(3) ? 0 : Among(1, 3); count > 0; --count)
            patterns.emplace_back(Of(Some));
        return patterns;
    }

    int Position()
    {
        static constexpr int Others[] = {-3, 7, LargestPosition - 1, LargestPosition, LargestPosition + 1};
        return OneIn(30) ? Of(Others) : OneIn(3) ? -1 : Among(-2, 4);
    }

    PARAM_TYPE ValueType()
    {
        static constexpr PARAM_TYPE Types[] = {
            PARAM_POINTER, PARAM_INT,       PARAM_INT,   PARAM_DOUBLE,   PARAM_STRING,    PARAM_STRING,
            PARAM_STRING,  PARAM_BINSTRING, PARAM_INT64, PARAM_UNSIGNED, PARAM_UNSIGNED64};
        return OneIn(40) ? static_cast<PARAM_TYPE>(Among(-1, 10)) : Of(Types);
    }

    std::string Text()
    {
        static char const* const Texts[] = {"", "x", "\xC3\xA4 <&>\"' \t\r\n]]>", " blanks ",
                                            "of a length that lies on the heap, surely"};
        if (!OneIn(6))
            return Of(Texts);
        auto const length = static_cast<std::size_t>(OneIn(20) ? 5000 : Among(1, 40));
        return std::string(length, static_cast<char>(Among('a', 'z')));
    }

    MODEL_RECORD Record(bool isWrite, bool mayBeNull)
    {
        MODEL_RECORD record;
        record.key = Key();
        record.pos = Position();
        record.type = ValueType();
        record.number = static_cast<int>(m_random());
        if (OneIn(2))
            record.number = record.number * 4'000'000'007LL;
        record.text = Text();
        if (record.type == PARAM_BINSTRING)
            record.text += std::string("\0\x01\xFF", static_cast<std::size_t>(Among(0, 3)));
        bool const isDeletion = isWrite && OneIn(4);
        bool const isQuery = !isWrite && OneIn(3);
        if (isDeletion || isQuery)
            record.type = isQuery && OneIn(2) ? PARAM_COUNT : PARAM_NONE;
        record.isNull = isDeletion ? !OneIn(20) : OneIn(60);
        if (mayBeNull && OneIn(60))
            record.key.reset();
        return record;
    }

    void Arguments(STEP& step)
    {
        bool const isWrite = step.action == ACTION::Write || step.action == ACTION::WriteTable;
        switch (step.action)
        {
        case ACTION::LogIn:
            step.source = OneIn(2) ? "admin" : OneIn(10) ? "nobody" : "operator";
            step.target = OneIn(6) ? "wrong" : step.source;
            break;
        case ACTION::Read:
        case ACTION::Write:
            step.records = {Record(isWrite, true)};
            break;
        case ACTION::ReadTable:
        case ACTION::WriteTable:
            step.isNullTable = OneIn(40);
            for (int count = Among(0, 6); count > 0; --count)
                step.records.push_back(Record(isWrite, false));
            break;
        case ACTION::Flood:
            step.table = STEP::Container;
            step.records.assign(70'000, {"A", PARAM_INT, -1, 7, "", false});
            break;
        case ACTION::Create:
        case ACTION::Limit:
            step.isNullTable = OneIn(3);
            if (!step.isNullTable)
                step.keys = Patterns();
            break;
        case ACTION::Operate:
        {
            static constexpr int Codes[] = {0, 2, 7, 10, 11, 98, 99, 100, 105, 108, -1};
            step.number = Of(Codes);
            break;
        }
        case ACTION::WalkTickets:
        case ACTION::WalkValues:
            Walk(step);
            break;
        case ACTION::Register:
            step.number = OneIn(8) ? 0 : 1;
            break;
        case ACTION::Enable:
        case ACTION::Disable:
            Switch(step);
            break;
        case ACTION::Put:
        case ACTION::Get:
        case ACTION::PrepareJob:
        case ACTION::SendJob:
            Files(step);
            break;
        case ACTION::OpenFile:
            step.number = Among(-1, 3);
            break;
        default:
            break;
        }
    }

    void Walk(STEP& step)
    {
        step.table = std::max(step.table, 0);
        static char const* const Prefixes[] = {"", "", "Job/", "A", "no such"};
        if (step.action == ACTION::WalkValues)
            step.source = Of(Prefixes);
        step.number = Among(0, 2);
        step.stop = OneIn(3) ? Among(1, 3) : 0;
        step.during = OneIn(2) ? Among(1, 6) : 0;
    }

    void Switch(STEP& step)
    {
        if (OneIn(2))
            step.id = TICKET_ID_ALL;
        if (OneIn(step.action == ACTION::Disable ? 4 : 30))
            step.type = step.id = TICKET_ID_ALL;
        step.number = OneIn(10) ? Among(1, 5) : 0;
        step.isNullTable = OneIn(20);
        if (!step.isNullTable)
            step.keys = Patterns();
    }

    void Files(STEP& step)
    {
        static char const* const Here[] = {"~/local/small", "~/local/small",   "~/local/large",
                                           "~/local/empty", "~/local/missing", "~/local/folder"};
        static char const* const There[] = {"$(TEMP)/a",    "$(TEMP)/a",    "$(TEMP)/b",    "$(TEMP)/",
                                            "$(TEMP)/no/a", "$(TEMP)/../a", "$(INSTALL)/a", "$(NOPE)/a",
                                            "$(JOB)/1/a",   "$(JOB)/1/b",   "$(JOB)/2/a",   "no variable"};
        static char const* const Names[] = {"a", "a", "b", "b", "", "..", "c/d"};
        step.number = OneIn(2) ? 1 : 0;
        step.source = Of(Here);
        step.target = Of(There);
        if (step.action == ACTION::Get)
        {
            step.source = Of(There);
            step.target = OneIn(10) ? NoSuchFolder : FetchedFile;
        }
        if (step.action == ACTION::SendJob)
            step.target = Of(Names);
        if (step.action != ACTION::PrepareJob)
            return;
        step.source = Of(Names);
        step.number = Among(0, 3);
        step.stop = Among(-1, 2);
    }

    std::mt19937 m_random;
};
}  // namespace

std::vector<STEP> RandomHistory(unsigned seed, std::size_t steps)
{
    DRAWING drawing(seed);
    std::vector<STEP> history(STEP::Sessions);
    for (int session = 0; session < STEP::Sessions; ++session)
    {
        STEP& step = history[static_cast<std::size_t>(session)];
        step.action = ACTION::LogIn;
        step.session = session;
        step.source = step.target = session == 1 ? "operator" : "admin";
    }
    while (history.size() < steps)
        history.push_back(drawing.Step());
    return history;
}
