// One operation of a random history against the module, as plain data: it can be carried out by the module
// and by a model of it alike, it can be left out, and it can be printed. What a step names that is not there
// (an open table, a session) is chosen by number from what there is, so a history stays a history whichever
// of its steps are left out.
#pragma once

#include "comgui/ticket/BIN_STRING.h"
#include "comgui/ticket/PARAM_TYPE.h"
#include <optional>
#include <string>
#include <vector>

enum class ACTION
{
    LogIn,        // source: the user, target: the password
    LogOut,       //
    Read,         // records[0]
    ReadTable,    // records
    Write,        // records[0]
    WriteTable,   // records
    Open,         //
    Close,        //
    Create,       // keys
    CreateNext,   //
    Delete,       //
    Limit,        // keys
    Operate,      // number: a code that means nothing, or means it elsewhere
    WhoAmI,       //
    TicketData,   //
    WalkTickets,  // number, stop, during
    WalkValues,   // source: the prefix; number, stop, during
    Register,     // number 0: without a callback
    Enable,       // keys; number: which of the ids that were ever given out, 0 the newest
    Disable,      // number likewise
    Hold,         // the thread that calls the callbacks waits in one, in the first program
    Release,      // it goes on
    Flood,        // records[0] FloodSize times in one table
    Put,          // source, target; number 1: later
    Get,          // likewise
    PrepareJob,   // source: the name; number: the queue, stop: the copies
    SendJob,      // source: the file, target: the name
    OpenFile,     // number: which file, -1 for none
    CloseFile,    //
};

struct MODEL_RECORD
{
    std::optional<std::string> key;
    PARAM_TYPE type = PARAM_INT;
    int pos = -1;
    long long number = 0;
    std::string text;     // of a string or of bytes
    bool isNull = false;  // no value, and no place for one
};

struct STEP
{
    // Sessions 0 to 2 live in the first program, session 3 in the second; Files are the tickets of the
    // factory.
    static constexpr int SessionsHere = 3;
    static constexpr int SessionElsewhere = 3;
    static constexpr int Sessions = 4;
    static constexpr int Files = 4;
    static constexpr int OpenFiles = 3;  // at most, at a time

    static constexpr int Container = -1;  // as the table: the container's slots instead

    static constexpr std::size_t FloodSize = 70'000;  // more records than may wait for a client

    ACTION action = ACTION::Read;
    int session = 0;
    int type = 0;
    int id = 0;
    int table = Container;  // counted from 0 among all that the session has had, or the number of a file
    std::vector<MODEL_RECORD> records{};
    bool isNullTable = false;  // the records, or the keys
    std::vector<std::string> keys{};
    std::string source{};
    std::string target{};
    int number = 0;  // of a walk: at which place, from 0, the following steps are carried out
    int stop = 0;    // of a walk: after how many places it is given up, 0 never
    int during = 0;  // of a walk: how many steps are carried out inside it

    // What it writes or reads.
    std::vector<MODEL_RECORD> Records() const
    {
        return action == ACTION::Flood ? std::vector(FloodSize, records[0]) : records;
    }

    // Is it for the second program?
    bool IsElsewhere() const { return session == SessionElsewhere; }
};

// The value word of a write of a record. Lives as long as the record.
class VALUE_WORD
{
public:
    explicit VALUE_WORD(MODEL_RECORD const& record);
    void const* Get() const { return m_word; }

private:
    double m_double;
    BIN_STRING m_binary;
    void const* m_word;
};

// As a line to read.
std::string LineOf(STEP const& step);
