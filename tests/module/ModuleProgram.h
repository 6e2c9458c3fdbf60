// A program that carries out the steps of a random history at the real module, through nothing but the
// module's tables. What it answers are the texts that the model gives, too. It reads each text and number
// that the module ever handed out once more at the last moment at which the module promises them. The path of
// the test's folder is "~" in every text.
#pragma once

#include "tests/module/ModelStep.h"
#include "tests/module/NotificationListener.h"
#include <array>
#include <deque>
#include <filesystem>
#include <memory>

class MODULE_PROGRAM
{
public:
    // number: of the program, 0 or 1. The site is "site" in the folder.
    MODULE_PROGRAM(std::filesystem::path folder, int number);

    // The answer to a step; of a walk, which nothing is carried out in, all that it came to.
    std::string Run(STEP const& step);

    // Called at each place of a walk; false ends the walk. Of a ticket text gives its values as they are when
    // it is called.
    using PLACE = std::function<bool(std::function<std::string()> const& text)>;
    int WalkTickets(STEP const& step, PLACE const& place);
    int WalkValues(STEP const& step, PLACE const& place);

    // Waits until the clients have been told of everything that is due, then gives what is new. Not while
    // the callbacks are held up.
    std::string News();
    bool IsHeld() const { return m_isHeld; }

    std::string Everything();  // every ticket with its values
    std::string Folders();     // the ticket files among them

private:
    struct HANDED_OUT
    {
        void const* address;
        std::string bytes;
    };
    struct SESSION
    {
        void* handle = nullptr;
        MTICKET_ACCESS const* access = nullptr;
        std::vector<STICKET_ACCESS const*> tables{};
        std::vector<HANDED_OUT> handedOut{};
        std::size_t listener = NoListener;
    };
    struct CLIENT_HERE
    {
        std::unique_ptr<LISTENER> listener;
        int id = 0;
        std::size_t seen = 0;
    };
    static constexpr std::size_t NoListener = ~std::size_t{0};

    // A file has what was handed out in a place of its own.
    SESSION& Who(STEP const& step)
    {
        return m_sessions[static_cast<std::size_t>(step.session == STEP::Files ? STEP::Files + step.table
                                                                               : step.session)];
    }
    STICKET_ACCESS const* TableOf(STEP const& step);  // null: the container's slots

    void LogInOwn();
    std::string LogIn(STEP const& step);
    std::string LogOut(STEP const& step);
    std::string Read(STEP const& step);
    std::string ReadTable(STEP const& step);
    std::string Write(STEP const& step);
    std::string WriteTable(STEP const& step);
    int Operate(STEP const& step, int code, void* arg);
    std::string Open(STEP const& step);
    std::string Close(STEP const& step);
    std::string Create(STEP const& step);
    std::string CreateNext(STEP const& step);
    std::string Delete(STEP const& step);
    std::string OperateAnything(STEP const& step);
    std::string Limit(STEP const& step);
    std::string WhoAmI(STEP const& step);
    std::string TicketData(STEP const& step);
    std::string AllOfWalk(STEP const& step);
    std::string Register(STEP const& step);
    int Register(void* hSession, LISTENER* listener, int& id);
    std::string Switch(STEP const& step);
    std::string Hold(STEP const&);
    std::string Release(STEP const&);
    std::string Carry(STEP const& step);
    std::string PrepareJob(STEP const& step);
    std::string SendJob(STEP const& step);
    std::string OpenFile(STEP const& step);
    std::string CloseFile(STEP const& step);

    std::string TextOfTable(SESSION& session, STICKET_ACCESS const* ticket);
    std::string TextOfFile(std::filesystem::path const& file);
    std::string NumberOf(SESSION& session, STICKET_ACCESS const* table);
    union READ_WORD;
    std::string TakeRead(SESSION& session, PARAM_TYPE type, READ_WORD const& word);
    void Keep(SESSION& session, PARAM_TYPE type, void const* word);
    static std::string WhatHasChanged(SESSION& session);
    void AwaitTransfers();
    void WriteOwnTicket();
    static std::string NewsOf(CLIENT_HERE& client);
    std::string Shown(std::string text) const;        // with "~" for the folder
    std::string Path(std::string const& text) const;  // the other way round

    std::filesystem::path const m_folder;
    int const m_number;
    MODULE m_module;
    std::array<STICKET_ACCESS const*, STEP::OpenFiles> m_files{};
    std::array<SESSION, STEP::Sessions + STEP::OpenFiles> m_sessions;  // the last ones for the files
    std::deque<CLIENT_HERE> m_clients;

    // The test's own session, which holds up the callbacks, and shows how far they have come.
    SESSION m_own;
    LISTENER m_ownListener;
    std::size_t m_ownCalls = 0;
    std::mutex m_gate;
    bool m_isHeld = false;
};
