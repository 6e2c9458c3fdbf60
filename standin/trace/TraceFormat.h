// What a trace consists of, for the bundle that writes it and the tool that reads it: a FileHead, then
// records. All numbers are little-endian, as on every machine that this is built for.
//
// A call is two records with one number, Began and Ended, so that one that never ended can be seen. Details
// of a call lie in between. While a program runs, its latest records lie in a second file, the ring
// (TraceRing.h); they stay there if it dies.
#pragma once

#include <cstdint>

namespace trace
{
inline constexpr char FileMagic[8] = {'C', 'G', 'T', 'R', 'A', 'C', 'E', '1'};
inline constexpr char RingSuffix[] = ".ring";

struct FileHead
{
    char magic[8];
    std::uint64_t start;  // CLOCK_MONOTONIC, ns; records count from here
    std::int64_t wall;    // the same moment since 1970, ns
    std::uint32_t process;
    std::uint32_t reserved;
};
static_assert(sizeof(FileHead) == 32);

enum class Kind : std::uint8_t
{
    Began = 1,    // fields: the arguments
    Ended = 2,    // fields: the result, then what came out
    Detail = 3,   // fields: a record of a table, a parameter or ticket of a walk
    Dropped = 4,  // fields: how many records were dropped before this one, as the ring was full
};

// In the order of CallNames.
enum class Call : std::uint8_t
{
    Open,
    Initialize,
    IsAlive,
    GetLocalAddress,
    Login,
    Logout,
    Uninitialize,
    UninitializeAsync,
    GetClientContainer,
    GetTicketData,
    SendCommand,
    PutFile,
    GetFile,
    PutFileSync,
    GetFileSync,
    SendJob,
    CreateTicket,
    DestroyTicket,
    MGet,
    MGetTable,
    MWalk,
    MSet,
    MSetTable,
    MOperation,
    MSwitch,
    MCreate,
    SGet,
    SGetTable,
    SWalk,
    SSet,
    SSetTable,
    SOption,
    Callback,  // the client's, called by the plug-in
    Count
};

struct CallText
{
    char const* name;
    char const* arguments;  // names, with commas
    char const* results;
    bool isZeroGood;  // entries give 0 for success, slots anything else
};

inline constexpr CallText CallTexts[] = {
    {"Open", "", "code,instance", true},
    {"InitializeEntry", "record,user,host,port,stamp", "code", true},
    {"IsAliveEntry", "host,port", "code", true},
    {"GetLocalAddressEntry", "host,port", "address", false},
    {"LoginEntry", "record,user,host,port", "code,session,userTicket,role,endPoint", true},
    {"LogoutEntry", "session", "code", true},
    {"UninitializeEntry", "record", "code", true},
    {"UninitializeAsyncEntry", "record", "code", true},
    {"GetClientContainerEntry", "session", "table", false},
    {"GetTicketDataEntry", "session,type,id,format,size", "code,size", true},
    {"SendCommandEntry", "session,command,size,data", "code,answer", true},
    {"PutFileEntry", "session,first,second", "code", true},
    {"GetFileEntry", "session,first,second", "code", true},
    {"PutFileSyncEntry", "session,first,second", "code", true},
    {"GetFileSyncEntry", "session,first,second", "code", true},
    {"SendJobEntry", "session,folder,path,name", "code", true},
    {"CreateTicket", "path", "table", false},
    {"DestroyTicket", "table", "", false},
    {"MGETPARAMETER", "session,type,id,key,as,pos", "done,value", false},
    {"MGETMULTIPAR", "session,type,id,records", "done,ok", false},
    {"MWALKTICKETS", "session,type", "done,tickets", false},
    {"MSETPARAMETER", "session,type,id,key,as,pos,value", "done", false},
    {"MSETMULTIPAR", "session,type,id,records", "done,ok", false},
    {"MOPERATION", "session,type,id,operation", "done,out", false},
    {"MENDISNOTIF", "session,type,id,notification,enable,keys", "done", false},
    {"MCREATETICKET", "session,type,id,keys", "table", false},
    {"SGETPARAMETER", "session,table,key,as,pos", "done,value", false},
    {"SGETMULTIPAR", "session,table,records", "done,ok", false},
    {"SWALKPARAMETERS", "session,table,prefix,limit", "done,parameters", false},
    {"SSETPARAMETER", "session,table,key,as,pos,value", "done", false},
    {"SSETMULTIPAR", "session,table,records", "done,ok", false},
    {"SOPTION", "session,table,option", "done", false},
    {"callback", "user,kind,argA,argB,code,records", "", false},
};
static_assert(sizeof CallTexts / sizeof *CallTexts == static_cast<std::size_t>(Call::Count));

struct RecordHead
{
    std::uint16_t size;  // of the record, head and fields
    Kind kind;
    Call call;
    std::uint32_t thread;
    std::uint64_t number;  // of the call
    std::uint64_t time;    // since the start, ns
};
static_assert(sizeof(RecordHead) == 24);

// A field: one of these, then its bytes.
enum class Field : std::uint8_t
{
    None = '-',        // nothing
    Int = 'i',         // 4 bytes
    Unsigned = 'u',    // 4
    Int64 = 'l',       // 8
    Unsigned64 = 'L',  // 8
    Double = 'd',      // 8
    Pointer = 'p',     // 8
    Text = 's',        // 4 of its length, 2 of how much of it is here, that much
    Bytes = 'b',       // the same
    Hidden = 'h',      // a value that is not written down
};

inline constexpr std::size_t LargestRecord = 248;
inline constexpr std::size_t MostOfAText = 96;  // so that no record is too large
}  // namespace trace
