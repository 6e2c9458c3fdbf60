// What a client does once it is logged in, by the services of the server. Codes stand in ModuleCodes.h.
#pragma once

#include "comgui/module/Session.h"
#include "standin/module/Container.h"

namespace standin
{
class ModuleSession : public comgui::plugin::Session
{
public:
    ModuleSession(Server& server, std::shared_ptr<standin::Session> session)
        : m_container(server, std::move(session))
    {
    }

    comgui::plugin::ContainerSlots* GetContainer() override { return &m_container; }
    bool End() override { return m_container.EndSession(); }
    bool HasEnded() const override;

    int Command(std::string_view name, int size, void* data) override;

    // Format 0, the only one so far, is the XML of a ticket file, UTF-8. *size: going in the room in buffer,
    // coming out what the data takes, in bytes; there is no final zero byte. With too little room, or a null
    // buffer, only *size is set.
    int TicketData(comgui::plugin::Address ticket, int format, int* size, void* buffer) override;

    // The source first, then the target. One of them is a server path, $(VARIABLE)/rest, the other is local.
    // Of a transfer that was begun the session is told the end.
    int PutFile(std::string_view local, std::string_view server, comgui::plugin::Transfer wanted) override;
    int GetFile(std::string_view server, std::string_view local, comgui::plugin::Transfer wanted) override;

    // The record must say "$(UPLOADJOB)", the job's own folder; its other words are not looked at.
    int SendJob(TJobIdentification const& job, std::string_view path, std::string_view name) override;

    int SetCallback(comgui::plugin::Callback callback, STICKET_ACCESS const& answer) override;
    int IsAlive(TCommandRecord& record) override;

    // The name of the job's file comes as $(JOB)/NAME. iArgA is the job's queue, iArgC the number of copies.
    int PrepareJob(TCommandRecord& record) override;
    int SetFolder(comgui::plugin::ClientFolder folder, std::string_view path) override;

    // "local.get.progress" puts the int64 "Transfer/Done" and "Transfer/Size" into the STICKET_ACCESS const*
    // that is its data: TransferService::ProgressOf. Without a transfer the keys are deleted.
    int OtherCommand(std::string_view name, int size, void* data) override;

private:
    int Carry(TransferService::Request const& request, comgui::plugin::Transfer wanted) const;
    int GetProgress(STICKET_ACCESS const* ticket) const;

    Server& GetServer() const { return m_container.Server(); }
    standin::Session& GetSession() const { return m_container.Session(); }

    Gate const& EveryCall() const { return m_container.EveryCall(); }

    Container m_container;
};
}  // namespace standin
