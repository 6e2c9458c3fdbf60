#include "tests/module/RandomHistory.h"

#include "comgui/ticket/TICKET_ID.h"
#include "tests/module/ModelFiles.h"
#include <iterator>
#include <random>

namespace
{
constexpr int LargestPosition = 0xFFFFFF;
constexpr int LargestTicketId = 0xFFFFFF;

// How often each action comes, among all of them together, in a history that prefers none.
struct SHARE
{
    ACTION action;
    int share;
};
constexpr SHARE Shares[] = {
    {ACTION::LogIn, 110},     {ACTION::LogOut, 20},     {ACTION::Read, 120},     {ACTION::ReadTable, 60},
    {ACTION::Write, 200},     {ACTION::WriteTable, 80}, {ACTION::Open, 60},      {ACTION::Close, 50},
    {ACTION::Create, 60},     {ACTION::CreateNext, 35}, {ACTION::Delete, 60},    {ACTION::Limit, 20},
    {ACTION::Operate, 4},     {ACTION::WhoAmI, 20},     {ACTION::TicketData, 8}, {ACTION::WalkTickets, 20},
    {ACTION::WalkValues, 25}, {ACTION::Register, 30},   {ACTION::Enable, 70},    {ACTION::Disable, 40},
    {ACTION::Hold, 25},       {ACTION::Release, 12},    {ACTION::Put, 30},       {ACTION::Get, 16},
    {ACTION::PrepareJob, 14}, {ACTION::SendJob, 12},    {ACTION::OpenFile, 25},  {ACTION::CloseFile, 25}};

constexpr char const* Patterns[] = {"A", "B", "Job/*", "a*", "A*", "*", "J*", "Job/State"};

class DRAWING
{
public:
    // A history does a few things often rather than all things now and then: what goes wrong only in a row
    // of certain steps would hardly ever be met.
    explicit DRAWING(unsigned seed) : m_hasFloods(seed % 32 == 16), m_random(seed)
    {
        static constexpr int Types[] = {3, 3, 7, 7, 17, 0};
        static constexpr int Ids[] = {1, 1, 2, 3, 0};
        static char const* const Keys[] = {"A",
                                           "B",
                                           "Job/State",
                                           "Job/Copies",
                                           "a",
                                           "\xC3\x84 <&>",
                                           "a rather long key that lies on the heap"};
        for (SHARE const& share : Shares)
            m_shares.push_back({share.action, share.share * Factor(share.action)});
        static constexpr int Sessions[] = {0, 0, 1, 1, 2, 2, STEP::SessionElsewhere};
        m_sessions = Some(Sessions, 6);
        static constexpr PARAM_TYPE ValueTypes[] = {
            PARAM_STRING, PARAM_STRING, PARAM_STRING,    PARAM_STRING,  PARAM_INT,      PARAM_INT,
            PARAM_DOUBLE, PARAM_INT64,  PARAM_BINSTRING, PARAM_POINTER, PARAM_UNSIGNED, PARAM_UNSIGNED64};
        m_valueTypes = Some(ValueTypes, 4);
        m_types = Some(Types, 2);
        m_ids = Some(Ids, 3);
        m_keys = Some(Keys, 4);
        m_patterns = Some(Patterns, 4);
    }

    STEP Step() { return Step(Action()); }

    // Few histories have floods, which take long. Twice in a row: the second must not lean on what the first
    // has left. Of use only when somebody in the first program is to be told of it, and is not.
    std::vector<STEP> Floods()
    {
        if (!m_hasFloods)
            return {};
        STEP base = Step(ACTION::Flood);
        base.type = Among(0, 1) ? 3 : 7;
        base.id = 1;
        std::vector<STEP> steps;
        auto const add = [&](ACTION action, int session)
        {
            STEP& step = steps.emplace_back(base);
            step.action = action;
            step.session = session;
            step.number = action == ACTION::Register ? 1 : 0;
            step.source = step.target = "admin";
        };
        int const listening = Among(0, STEP::SessionsHere - 1);
        for (ACTION const action :
             {ACTION::LogIn, ACTION::Create, ACTION::Limit, ACTION::Register, ACTION::Enable})
            add(action, listening);
        for (int flood = 0; flood < 2; ++flood)
        {
            add(ACTION::Release, 0);
            add(ACTION::Hold, 0);
            add(ACTION::Flood, listening);
            for (PARAM_TYPE const type : {PARAM_INT, PARAM_POINTER, PARAM_INT})
            {
                add(ACTION::Write, listening);
                steps.back().records[0].type = type;
            }
        }
        return steps;
    }

private:
    STEP Step(ACTION action)
    {
        STEP step;
        step.action = action;
        step.session = Session(step.action);
        step.type = Type();
        step.id = Id();
        step.table = step.session == STEP::Files ? Among(0, STEP::OpenFiles - 1)
                     : OneIn(2)                  ? STEP::Container
                                                 : Among(0, 9);
        Arguments(step);
        return step;
    }

    int Among(int from, int to)  // both included
    {
        return from + static_cast<int>(m_random() % static_cast<unsigned>(to - from + 1));
    }
    bool OneIn(int chances) { return Among(1, chances) == 1; }
    template <typename Range>
    auto Of(Range const& range) -> decltype(*std::begin(range))
    {
        return *std::next(std::begin(range), Among(0, static_cast<int>(std::size(range)) - 1));
    }

    // Up to so many of a range.
    template <typename T, std::size_t Size>
    std::vector<T> Some(T const (&range)[Size], int most)
    {
        std::vector<T> some;
        for (int count = Among(1, most); count > 0; --count)
            some.push_back(Of(range));
        return some;
    }

    int Factor(ACTION action)
    {
        static constexpr int Factors[] = {0, 1, 1, 1, 2, 2, 4};
        return action == ACTION::LogIn || action == ACTION::Release ? 1 : Of(Factors);
    }

    ACTION Action()
    {
        int sum = 0;
        for (SHARE const& share : m_shares)
            sum += share.share;
        int drawn = Among(1, sum);
        auto share = m_shares.begin();
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
        if (isOfFiles || (mayBeOfFiles && OneIn(4)))
            return STEP::Files;
        bool const isOfProgram = action == ACTION::Hold || action == ACTION::Release;
        return isOfProgram ? 0 : Of(m_sessions);
    }

    int Type()
    {
        static constexpr int Others[] = {-1, 0, 3, 7, 17, 100};
        return OneIn(20) ? Of(Others) : Of(m_types);
    }

    int Id()
    {
        static constexpr int Others[] = {LargestTicketId - 1, LargestTicketId, -1, LargestTicketId + 1, 4, 5};
        return OneIn(15) ? Of(Others) : Of(m_ids);
    }

    std::string Key() { return OneIn(60) ? "" : Of(m_keys); }

    std::vector<std::string> KeyTable()
    {
        std::vector<std::string> table;
        for (int count = OneIn(3) ? 0 : Among(1, 3); count > 0; --count)
            table.emplace_back(Of(m_patterns));
        return table;
    }

    int Position()
    {
        static constexpr int Others[] = {-3, 7, LargestPosition - 1, LargestPosition, LargestPosition + 1};
        return OneIn(30) ? Of(Others) : OneIn(3) ? -1 : Among(-2, 2);
    }

    PARAM_TYPE ValueType() { return OneIn(30) ? static_cast<PARAM_TYPE>(Among(-1, 10)) : Of(m_valueTypes); }

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
            if (OneIn(30))
                ManyKeys(step);
            break;
        case ACTION::Flood:
            step.table = STEP::Container;
            step.records = {{"A", PARAM_INT, -1, 7, "", false}};
            break;
        case ACTION::Create:
        case ACTION::Limit:
            step.isNullTable = OneIn(3);
            if (!step.isNullTable)
                step.keys = KeyTable();
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
            step.number = Among(-1, TicketFiles);  // the last is not there
            break;
        default:
            break;
        }
    }

    // More than a ticket keeps in one piece.
    void ManyKeys(STEP& step)
    {
        bool const isDeletion = OneIn(3);
        int const first = Among(0, 100);
        for (int key = first; key < first + 150; ++key)
            step.records.push_back({"Many/" + std::to_string(key), isDeletion ? PARAM_NONE : PARAM_INT, -1,
                                    key, "", isDeletion});
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
            step.keys = KeyTable();
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

    bool const m_hasFloods;
    std::mt19937 m_random;
    std::vector<SHARE> m_shares;
    std::vector<int> m_sessions;
    std::vector<PARAM_TYPE> m_valueTypes;
    std::vector<int> m_types;
    std::vector<int> m_ids;
    std::vector<char const*> m_keys;
    std::vector<char const*> m_patterns;
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
    auto const floods = drawing.Floods();
    while (history.size() + floods.size() < steps)
        history.push_back(drawing.Step());
    auto const middle = history.begin() + static_cast<std::ptrdiff_t>(history.size() / 2);
    history.insert(middle, floods.begin(), floods.end());
    return history;
}
