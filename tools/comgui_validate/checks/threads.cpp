// Calls from other threads, from several at once, and from a client that dies.
#include "tools/comgui_validate/Session.h"
#include "tools/comgui_validate/Subject.h"

#include <csignal>
#include <exception>
#include <sys/wait.h>
#include <thread>
#include <unistd.h>

namespace validate
{
namespace
{
constexpr int Threads = 4;

// What one of them throws is thrown here, after the end of them all.
void AtOnce(int count, std::function<void(int number)> const& work)
{
    std::vector<std::exception_ptr> failures(static_cast<std::size_t>(count));
    std::vector<std::thread> threads;
    threads.reserve(failures.size());
    for (int i = 0; i < count; ++i)
        threads.emplace_back(
            [&, i]
            {
                try
                {
                    work(i);
                }
                catch (...)
                {
                    failures[static_cast<std::size_t>(i)] = std::current_exception();
                }
            });
    for (std::thread& thread : threads)
        thread.join();
    for (std::exception_ptr const& failure : failures)
        if (failure)
            std::rethrow_exception(failure);
}

Value LastNumber(int number, int rounds) { return Int(number * 1000 + rounds - 1); }

void WriteAndRead(char const* rule, Subject& subject, int number, int rounds)
{
    for (int round = 0; round < rounds; ++round)
    {
        subject.ExpectWrite(rule, Key("Number"), Int(number * 1000 + round));
        subject.ExpectValue(rule, Key("Number"), Int(number * 1000 + round));
        subject.ExpectWrite(rule, Key("Text"), Text(std::string(200, static_cast<char>('a' + number))));
        subject.ExpectValue(rule, Key("Text"), Text(std::string(200, static_cast<char>('a' + number))));
    }
}

void Another(Trial& trial)
{
    Session session(trial);
    ScratchTicket const ticket(session);
    InContainer subject(trial, session.Container(), ticket.Type(), ticket.Id());
    AtOnce(1, [&](int) { WriteAndRead("G3", subject, 1, 5); });
    AtOnce(1,
           [&](int)
           {
               Record record(trial);
               trial.ExpectZero("G3", record.Initialize());
               trial.ExpectZero("G3", record.LogIn());
               trial.ExpectZero("G3", record.LogOut());
           });
}

void FourTickets(Trial& trial)
{
    Session session(trial);
    std::vector<std::unique_ptr<ScratchTicket>> tickets;
    tickets.reserve(Threads);
    for (int i = 0; i < Threads; ++i)
        tickets.push_back(std::make_unique<ScratchTicket>(session));
    if (!tickets.back()->IsOwn())
        throw Skipped("no tickets can be made; name a type with --option ticket-type=N");
    std::vector<std::unique_ptr<InContainer>> subjects;
    subjects.reserve(Threads);
    for (auto const& ticket : tickets)
        subjects.push_back(
            std::make_unique<InContainer>(trial, session.Container(), ticket->Type(), ticket->Id()));
    constexpr int rounds = 100;
    AtOnce(Threads, [&](int number)
           { WriteAndRead("G4", *subjects[static_cast<std::size_t>(number)], number, rounds); });
    // Of two that were one, one lacks its last number now, whether or not the threads met.
    for (int number = 0; number < Threads; ++number)
        subjects[static_cast<std::size_t>(number)]->ExpectValue("G4", Key("Number"),
                                                                LastNumber(number, rounds));
}

void FourSessions(Trial& trial)
{
    {
        Session const first(trial);  // skips where nobody can log in
    }
    AtOnce(Threads,
           [&](int number)
           {
               Record record(trial);
               record->iLocalPort += static_cast<unsigned int>(number);
               trial.ExpectZero("G4", record.Initialize());
               trial.ExpectZero("G4", record.LogIn());
               trial.ExpectZero("G4", record.LogOut());
           });
}

struct Address
{
    int type = -1;
    int id = -1;
};

// Logs in, makes a ticket and writes to it, tells its address, and is gone.
[[noreturn]] void LiveAndDie(Trial& trial, int tell)
{
    try
    {
        Session session(trial);
        ScratchTicket ticket(session);
        InContainer subject(trial, session.Container(), ticket.Type(), ticket.Id());
        subject.Write(Key("Left"), Int(1));
        Address const own{ticket.IsOwn() ? ticket.Type() : -1, ticket.Id()};
        if (write(tell, &own, sizeof own) == sizeof own)
            std::raise(SIGKILL);
    }
    catch (...)
    {
    }
    _exit(1);
}

void DeathOfAClient(Trial& trial)
{
    int pipes[2];
    if (pipe(pipes) != 0)
        throw Skipped("no pipe can be made");
    pid_t const child = fork();
    if (child == 0)
        LiveAndDie(trial, pipes[1]);
    close(pipes[1]);
    Address left;
    bool const hasLived = child > 0 && read(pipes[0], &left, sizeof left) == sizeof left;
    close(pipes[0]);
    if (child > 0)
        waitpid(child, nullptr, 0);
    if (!hasLived)
        throw Skipped("the client that was to die could not write anything");
    Record record(trial);
    trial.ExpectZero("G5", record.Initialize());
    trial.ExpectZero("G5", record.LogIn());
    record.LogOut();
    Session session(trial);
    ScratchTicket const ticket(session);
    InContainer subject(trial, session.Container(), ticket.Type(), ticket.Id());
    WriteAndRead("G5", subject, 1, 5);
    MTICKET_ACCESS const* const container = session.Container();
    if (left.type >= 0)
        container->MOPERATION(container->Instance, left.type, left.id, MTICKET_OP_DELETE, nullptr);
}
}  // namespace

std::vector<Check> ThreadChecks()
{
    return {{"threads.another", Another},
            {"threads.four-tickets", FourTickets},
            {"threads.four-sessions", FourSessions},
            {"death.of-a-client", DeathOfAClient}};
}
}  // namespace validate
