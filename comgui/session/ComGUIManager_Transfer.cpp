// What is asked of the server beside its tickets: commands by name, files, jobs.
#include "comgui/session/ComGUIManager.h"

#include "comgui/foundation/CharSets.h"
#include "comgui/session/TCommandRecord.h"
#include "comgui/session/TJobIdentification.h"
#include <cstdio>
#include <cstring>
#include <memory>
#include <new>

namespace
{
constexpr int ServerNotReachable = -2005;
constexpr unsigned int CommandMagic = 0x49494949;
constexpr char UploadFolder[] = "$(UPLOADJOB)";  // and not resolved here, nor is $(JOB): the server does that

TCommandRecord NewCommand()
{
    TCommandRecord record = {};
    record.nMagic = CommandMagic;
    record.nSize = sizeof record;
    return record;
}

bool TakesAFolder(char const* command)
{
    return std::strcmp(command, "local.set.previewfolder") == 0 ||
           std::strcmp(command, "local.set.thumbnailfolder") == 0;
}
}  // namespace

int ComGUIManager::SendCommand(char* command, int size, void* data)
{
    // Here alone, and not in the form below, the size of a folder is its text's, whatever the caller says.
    if (TakesAFolder(command))
        size = static_cast<int>(std::strlen(static_cast<char const*>(data)));
    return SendCommand(nullptr, command, size, data);
}

int ComGUIManager::SendCommand(TLogin* login, char* command, int size, void* data)
{
    TLogin const* const record = login ? login : m_pLogin;
    return m_interface.SendCommandEntry(m_hModuleInstance, record->hSession, command, size, data);
}

int ComGUIManager::SendRecord(char const* command, TCommandRecord& record)
{
    return SendCommand(const_cast<char*>(command), sizeof record, &record);
}

int ComGUIManager::IsAlive(char*, int)
{
    TCommandRecord record = NewCommand();
    record.iArgB = 1;
    record.iResult = -1;
    bool const answered = SendRecord("remote.system.isalive", record) == 0 && record.iResult >= 0;
    return answered ? 0 : ServerNotReachable;
}

bool ComGUIManager::IsServerOnline() { return IsAlive(nullptr, 0) != ServerNotReachable; }

int ComGUIManager::PutFile(char* first, char* second) { return PutFile(m_pLogin, first, second); }

int ComGUIManager::PutFile(TLogin* login, char* first, char* second)
{
    return m_interface.PutFileEntry(m_hModuleInstance, login->hSession, first, second);
}

int ComGUIManager::PutFileSync(char* first, char* second)
{
    return m_interface.PutFileSyncEntry(m_hModuleInstance, m_pLogin->hSession, first, second);
}

int ComGUIManager::GetFile(char* first, char* second) { return GetFile(m_pLogin, first, second); }

int ComGUIManager::GetFile(TLogin* login, char* first, char* second)
{
    return m_interface.GetFileEntry(m_hModuleInstance, login->hSession, first, second);
}

int ComGUIManager::GetFileSync(char* first, char* second)
{
    return m_interface.GetFileSyncEntry(m_hModuleInstance, m_pLogin->hSession, first, second);
}

int ComGUIManager::SendJob(TJobIdentification* job, char* path, char* name)
{
    return SendJob(m_pLogin, job, path, name);
}

int ComGUIManager::SendJob(TLogin* login, TJobIdentification* job, char* path, char* name)
{
    return m_interface.SendJobEntry(m_hModuleInstance, login->hSession, job, path, name);
}

int ComGUIManager::PrepareJob(std::string path, int a, int b, int c, int d, int e)
{
    TCommandRecord record = NewCommand();
    record.iArgA = a;  // the arguments' order is not that of the fields: servers count on it
    record.iArgB = e;
    record.iArgC = d;
    record.iResult = b;
    if (c >= 0)
        std::snprintf(record.szText1, sizeof record.szText1, "%d", c);
    path = "$(JOB)/" + LeafName(path);
    path.copy(record.szText2, sizeof record.szText2);  // a long one to the last byte: the server counts
    return SendRecord("remote.job.prepare", record) == 0 ? record.iResult : -1;
}

int ComGUIManager::UploadJob(std::string path, int a, unsigned int b, int c, int d)
{
    TJobIdentification job = {};
    job.nSize = sizeof job;
    job.iJobArg1 = d;
    job.iJobArg2 = b;
    job.iJobArg4 = c;
    std::unique_ptr<char[]> const folder(new (std::nothrow) char[sizeof UploadFolder]());
    if (!folder)
        return 0;
    job.pszUploadFolder = folder.get();
    job.iJobArg3 = a;
    std::memcpy(folder.get(), UploadFolder, sizeof UploadFolder);
    return SendJob(&job, path.data(), LeafName(path).data()) == 0 ? 1 : 0;
}

std::string ComGUIManager::LeafName(std::string const& path)
{
    std::size_t const separator = CharSets::DBCS::find_last_of(path, "\\/", std::string::npos);
    return separator == std::string::npos ? path : path.substr(separator + 1);
}
