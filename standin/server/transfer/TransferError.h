// How a transfer of a file or job ends. The numbers are those that clients know.
#pragma once

#include <stdexcept>

namespace standin
{
enum TransferResult : int
{
    Transferred = 0,
    JobGone = 108,           // somebody has deleted the job's ticket meanwhile
    TransferFailed = 112,    // out of memory and the like
    SourceUnreadable = 113,  // missing, or without the right to read it
    NotAFile = 114,          // a folder, device or the like stands where a regular file is due
    PathRefused = 115,       // a path or name that the server does not take
    TargetUnwritable = 116,  // disk full, or a folder that is missing or may not be written to
    EmptyJob = 117,
    TransferCut = 118,       // by the session's logout, or by the end of the process
    TooManyTransfers = 119,  // wait
};

// what() is one clear line, or empty where there is nothing to tell.
class TransferError : public std::runtime_error
{
public:
    TransferError(TransferResult result, std::string const& line) : std::runtime_error(line), m_result(result)
    {
    }
    TransferResult Result() const { return m_result; }

private:
    TransferResult m_result;
};
}  // namespace standin
