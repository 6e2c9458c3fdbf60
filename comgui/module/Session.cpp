#include "comgui/module/Session.h"

#include <cstring>

namespace comgui::plugin
{
namespace
{
TCommandRecord* RecordIn(int size, void* data)
{
    constexpr unsigned Magic = 0x49494949;
    auto* const record = static_cast<TCommandRecord*>(data);
    bool const isRecord = record && size == sizeof *record && record->nMagic == Magic;
    return isRecord && record->nSize == sizeof *record ? record : nullptr;
}
}  // namespace

int Session::TicketData(Address, int, int*, void*) { return NotOffered; }

int Session::PutFile(std::string_view, std::string_view, Transfer) { return NotOffered; }

int Session::GetFile(std::string_view, std::string_view, Transfer) { return NotOffered; }

int Session::SendJob(TJobIdentification const&, std::string_view, std::string_view) { return NotOffered; }

int Session::IsAlive(TCommandRecord&) { return NotOffered; }

int Session::PrepareJob(TCommandRecord&) { return NotOffered; }

int Session::SetFolder(ClientFolder, std::string_view) { return NotOffered; }

int Session::OtherCommand(std::string_view, int, void*) { return NotOffered; }

int Session::SetCallback(Callback callback, STICKET_ACCESS const& answer)
{
    if (!m_notifications)
        return NotOffered;
    int const id = m_notifications->NewId();
    // The answer first: nobody could ever switch off what came under an id that did not arrive.
    if (!Callback::PutId(answer, id))
        return InvalidArgument;
    bool const isRegistered = m_notifications->Register(*this, id, callback);
    if (m_isSilent)  // logged out meanwhile, by another thread
        m_notifications->Remove(*this);
    return isRegistered && !m_isSilent ? Done : UnknownSession;
}

void Session::Silence()
{
    m_isSilent = true;
    if (m_notifications)
        m_notifications->Remove(*this);
}

int Session::Command(std::string_view name, int size, void* data)
{
    if (name == "local.set.callback")
    {
        auto const* const ticket = static_cast<STICKET_ACCESS const*>(data);
        auto const callback = ticket ? Callback::In(*ticket) : std::nullopt;
        return callback ? SetCallback(*callback, *ticket) : int{InvalidArgument};
    }
    bool const isPreview = name == "local.set.previewfolder";
    if (isPreview || name == "local.set.thumbnailfolder")
    {
        if (!data || size <= 0)
            return InvalidArgument;
        auto const* const text = static_cast<char const*>(data);
        return SetFolder(isPreview ? ClientFolder::Preview : ClientFolder::Thumbnail,
                         {text, strnlen(text, static_cast<std::size_t>(size))});
    }
    bool const isQuestion = name == "remote.system.isalive";
    if (isQuestion || name == "remote.job.prepare")
    {
        TCommandRecord* const record = RecordIn(size, data);
        if (!record)
            return InvalidArgument;
        return isQuestion ? IsAlive(*record) : PrepareJob(*record);
    }
    return OtherCommand(name, size, data);
}
}  // namespace comgui::plugin
