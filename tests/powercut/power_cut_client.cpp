// A client of the site that COMGUI_SITE names, for the tests of power cuts. It works while the recorder
// writes down what happens to its files, and puts a mark into the log before and after each deed; or it looks
// at what a power cut has left.
#include "tests/powercut/History.h"
#include "tests/support/SiteClient.h"

#include <cstdio>
#include <cstring>
#include <dlfcn.h>
#include <iostream>
#include <stdexcept>
#include <thread>

namespace
{
constexpr char Help[] = R"(Works on the site that COMGUI_SITE names:
  jobs COUNT FOLDER    sends the files FOLDER/job-0, FOLDER/job-1 ...
  deletions COUNT FOLDER
                       the same, and deletes each job when it is in
  history FIRST COUNT  makes so many steps of the history, from that one on
  crowd NAME COUNT     two threads count up to COUNT, under the keys NAME0 and NAME1 of ticket 60/1
  carry COUNT FOLDER TARGET
                       puts the files FOLDER/job-0, FOLDER/job-1 ... over $(TEMP)/file in turn, and gets that
                       over the file TARGET each time
  system COUNT         writes so many tables into the system ticket
  file PATH COUNT      opens, changes and saves a ticket file so many times
  inspect              prints the jobs and the tickets of the history
)";

constexpr char const* SingleKeys[] = {"Single", "A0", "A1", "B0", "B1"};

void Mark(std::string const& text)
{
    using Function = void (*)(char const*);
    static auto const mark = reinterpret_cast<Function>(dlsym(RTLD_DEFAULT, "comgui_disk_mark"));
    if (!mark)
        throw std::runtime_error("the recorder is not loaded");
    mark(text.c_str());
}

void Must(bool isDone, std::string const& what)
{
    if (!isDone)
        throw std::runtime_error(what + " has failed");
}

// The deed as a whole, between its two marks.
template <typename Deed>
void Mark(std::string const& name, Deed const& deed)
{
    Mark("begun " + name);
    Must(deed(), name);
    Mark("done " + name);
}

bool SendJob(std::string path, std::string name)
{
    char folder[] = "$(UPLOADJOB)";
    TJobIdentification job = {};
    job.nSize = sizeof job;
    job.pszUploadFolder = folder;
    return SiteClient::Manager().SendJob(&job, path.data(), name.data()) == 0;
}

bool Step(SiteClient const& client, int step)
{
    using Deed = SiteHistory::Deed;
    TicketName const ticket{SiteHistory::Type, SiteHistory::IdOf(step)};
    switch (SiteHistory::DeedOf(step))
    {
    case Deed::Create:
        return client.Create(ticket);
    case Deed::SetSingle:
        return client.Set(ticket, "Single", step);
    case Deed::SetTable:
    case Deed::SetTableAgain:
        return client.SetTable(ticket, step);
    case Deed::Append:
    case Deed::AppendAgain:
        return client.Set(ticket, "List", step, -2);
    case Deed::CreateNext:
        return client.CreateNext(SiteHistory::NumberedType) == ticket.id;
    case Deed::RemoveOrDelete:
        return SiteHistory::Deletes(step) ? client.Delete(ticket) : client.Remove(ticket, "Single");
    }
    return false;
}

void Jobs(int count, std::string const& folder)
{
    for (int i = 0; i < count; ++i)
    {
        std::string const name = "job-" + std::to_string(i);
        Mark(std::to_string(i), [&] { return SendJob(folder + "/" + name, name); });
    }
}

// Sends each and deletes it again.
void Deletions(SiteClient const& client, int count, std::string const& folder)
{
    for (int i = 0; i < count; ++i)
    {
        std::string const name = "job-" + std::to_string(i);
        Mark(std::to_string(i),
             [&] {
                 return SendJob(folder + "/" + name, name) && client.Delete({3, client.Ids(3).back()});
             });
    }
}

void Carry(int count, std::string const& folder, std::string target)
{
    char server[] = "$(TEMP)/file";
    for (int i = 0; i < count; ++i)
    {
        std::string source = folder + "/job-" + std::to_string(i);
        Mark(std::to_string(i),
             [&]
             {
                 return SiteClient::Manager().PutFileSync(source.data(), server) == 0 &&
                        SiteClient::Manager().GetFileSync(server, target.data()) == 0;
             });
    }
}

void History(SiteClient const& client, int first, int count)
{
    for (int i = first; i < first + count; ++i)
        Mark(std::to_string(i), [&] { return Step(client, i); });
}

void Crowd(SiteClient const& client, std::string const& name, int count)
{
    TicketName const ticket{SiteHistory::Type, 1};
    client.Create(ticket);  // the other program may have been faster
    auto const countUp = [&](std::string const& key)
    {
        for (int i = 1; i <= count; ++i)
            Mark(key + " " + std::to_string(i), [&] { return client.Set(ticket, key.c_str(), i); });
    };
    std::thread other(countUp, name + "1");
    countUp(name + "0");
    other.join();
}

void System(SiteClient const& client, int count)
{
    for (int i = 1; i <= count; ++i)
        Mark(std::to_string(i), [&] { return client.SetTable({0, 0}, i); });
}

void File(char const* path, int count)
{
    for (int i = 1; i <= count; ++i)
        Mark(std::to_string(i),
             [&]
             {
                 STICKET_ACCESS const* ticket = hSTicketInstance->CreateTicket(path);
                 Must(ticket != nullptr, "opening the file");
                 for (std::size_t key = 0; key < SiteClient::TableSize; ++key)
                     ticket->SSETPARAMETER(ticket->Instance, ("Table/" + std::to_string(key)).c_str(),
                                           PARAM_INT, &i, -1);
                 hSTicketInstance->DestroyTicket(&ticket);
                 return ticket == nullptr;
             });
}

std::string TextOf(int job, char const* key)
{
    char const* text = nullptr;
    bool const isThere = SiteClient::Manager().GetParameter(3, job, key, PARAM_STRING, &text, -1) != 0;
    return isThere && text ? text : "none";
}

void Inspect(SiteClient const& client)
{
    for (int const job : client.Ids(3))
    {
        int state = -1;
        SiteClient::Manager().GetParameter(3, job, "Job/State", PARAM_INT, &state, -1);
        std::cout << "job " << state << " " << TextOf(job, "Job/Identification/Name") << " "
                  << TextOf(job, "Job/File") << "\n";
    }
    for (int const type : {SiteHistory::Type, SiteHistory::NumberedType})
        for (int const id : client.Ids(type))
        {
            TicketText ticket;
            for (char const* const key : SingleKeys)
                if (auto const value = client.Get({type, id}, key))
                    ticket.values[key] = *value;
            ticket.list = client.List({type, id}, "List");
            auto const table = client.Table({type, id});
            ticket.isTorn = !SiteClient::IsWhole(table);
            if (!table.empty())
                ticket.table = table.front();
            std::cout << "ticket " << type << "/" << id << ticket.Text() << "\n";
        }
    std::cout << "end" << std::endl;
}

void Run(std::vector<std::string> const& words)
{
    SiteClient client;
    std::string const& command = words.at(0);
    if (command == "file")
    {
        SiteClient::Manager();  // loads the module; no session is needed
        return File(words.at(1).c_str(), std::stoi(words.at(2)));
    }
    Must(client.LogIn() == 0, "the login");
    if (command == "inspect")
        return Inspect(client);
    Mark("ready");
    if (command == "jobs")
        Jobs(std::stoi(words.at(1)), words.at(2));
    else if (command == "deletions")
        Deletions(client, std::stoi(words.at(1)), words.at(2));
    else if (command == "history")
        History(client, std::stoi(words.at(1)), std::stoi(words.at(2)));
    else if (command == "carry")
        Carry(std::stoi(words.at(1)), words.at(2), words.at(3));
    else if (command == "crowd")
        Crowd(client, words.at(1), std::stoi(words.at(2)));
    else if (command == "system")
        System(client, std::stoi(words.at(1)));
    else
        throw std::invalid_argument("no such command");
}
}  // namespace

int main(int argc, char** argv)
{
    std::vector<std::string> const words(argv + 1, argv + argc);
    if (words.empty() || words[0] == "--help")
    {
        (words.empty() ? std::cerr : std::cout) << Help;
        return words.empty() ? 2 : 0;
    }
    try
    {
        Run(words);
    }
    catch (std::exception const& error)
    {
        std::cerr << "power_cut_client: " << words[0] << ": " << error.what() << "\n";
        return 1;
    }
    return 0;
}
