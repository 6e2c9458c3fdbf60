// Words of changes, from the registration of a callback to the silence after it.
#include "tools/comgui_validate/Listener.h"
#include "tools/comgui_validate/Subject.h"

#include "comgui/ticket/TICKET_ID.h"
#include <algorithm>
#include <cstring>
#include <map>
#include <thread>

namespace validate
{
namespace
{
// A session that hears of a ticket of its own. The listener stays behind: a plug-in may call late.
struct Hearing
{
    explicit Hearing(Trial& trial, std::vector<std::string> const& keys = {})
        : session(trial), ticket(session), listener(Listener::Begin(session)),
          subject(trial, session.Container(), ticket.Type(), ticket.Id())
    {
        listener.SwitchOn(ticket.Type(), ticket.Id(), keys);
        listener.Forget();
    }
    ~Hearing()
    {
        if (isOn)
            listener.SwitchOff(ticket.Type(), ticket.Id());
    }

    Session session;
    ScratchTicket ticket;
    Listener& listener;
    InContainer subject;
    bool isOn = true;
};

void Register(Trial& trial)
{
    Session session(trial);
    auto const& listener = Listener::Begin(session);
    trial.ExpectZero("N1", listener.Result());
    trial.Expect("N1", listener.Id() >= 0, "iGUINotificationID " + std::to_string(listener.Id()),
                 "an id of 0 or above");
}

void Change(Trial& trial)
{
    Hearing hearing(trial);
    for (Value const& value : {Int(-5), Text("text"), Double(0.5)})
    {
        hearing.subject.ExpectWrite("V2", Key("Told"), value);
        auto const report = hearing.listener.AwaitChange(Key("Told"));
        trial.Expect("N2", !hearing.listener.HadForeignUser(), "a callback with another pUser",
                     "the registered one");
        trial.Expect("N3", report.has_value(), "no callback of kind 1 with the key", "one");
        auto const record = std::find_if(report->records.begin(), report->records.end(),
                                         [](ReportedRecord const& each) { return each.key == Key("Told"); });
        trial.Expect("N3", record->value == value, Shown(record->value), Shown(value));
    }
}

void OneKeyPointer(Trial& trial)
{
    Hearing hearing(trial);
    std::string const list = Key("List");
    std::string const other = Key("Other");
    Value const values[] = {Int(1), Int(2), Int(3)};
    WrittenWord const words[] = {WrittenWord(values[0]), WrittenWord(values[1]), WrittenWord(values[2])};
    SETMULTIPAR table[5]{};
    for (int i = 0; i < 3; ++i)
        table[i] = ToWrite(list, words[i], PARAM_INT, i == 0 ? -1 : i);
    table[3] = ToWrite(other, words[0], PARAM_INT, -1);
    hearing.subject.WriteTable(table);
    auto const report = hearing.listener.AwaitChange(list);
    trial.Expect("N3", report.has_value(), "no callback of kind 1 with the key", "one");
    std::map<std::string, void const*> pointers;
    for (ReportedRecord const& record : report->records)
    {
        auto const [place, isFirst] = pointers.emplace(record.key, record.keyPointer);
        trial.Expect("N4", isFirst || place->second == record.keyPointer,
                     "two pointers for the key " + Quoted(record.key), "one");
        for (auto const& [key, pointer] : pointers)
            trial.Expect("N4", key == record.key || pointer != record.keyPointer, "one pointer for two keys",
                         "one for each");
    }
}

void Order(Trial& trial)
{
    constexpr int Count = 50;
    Hearing hearing(trial);
    for (int i = 1; i <= Count; ++i)
        hearing.subject.ExpectWrite("V2", Key("Number"), Int(i));
    int newest = 0;
    while (newest < Count)
    {
        auto const report = hearing.listener.AwaitChange(Key("Number"));
        trial.Expect("N5", report.has_value(), "nothing behind the change " + std::to_string(newest),
                     "all up to " + std::to_string(Count));
        for (ReportedRecord const& record : report->records)
            if (record.key == Key("Number") && record.value)
            {
                int number = 0;
                std::memcpy(&number, record.value->bytes.data(), sizeof number);
                trial.Expect("N5", number > newest,
                             std::to_string(number) + " behind " + std::to_string(newest),
                             "the order of the changes");
                newest = number;
            }
    }
}

void ExpectSilence(Trial& trial, char const* rule, Listener const& listener, char const* when)
{
    std::this_thread::sleep_for(Silence);
    trial.Expect(rule, listener.All().empty(), std::string("a callback ") + when, "none");
}

void OnlyTheKeys(Trial& trial)
{
    Hearing hearing(trial, {Key("Wanted")});
    hearing.subject.ExpectWrite("V2", Key("Unwanted"), Int(1));
    hearing.subject.ExpectWrite("V2", Key("Wanted"), Int(2));
    trial.Expect("N6", hearing.listener.AwaitChange(Key("Wanted")).has_value(), "no callback for the key",
                 "one");
    hearing.listener.Forget();
    hearing.subject.ExpectWrite("V2", Key("Unwanted"), Int(3));
    std::this_thread::sleep_for(Silence);
    for (Report const& report : hearing.listener.All())
        for (ReportedRecord const& record : report.records)
            trial.Expect("N6", record.key == Key("Wanted"), "a callback for the key " + Quoted(record.key),
                         "none for keys that were not asked for");
}

void KeepsNoKeys(Trial& trial)
{
    Hearing hearing(trial);
    std::string key = Key("Wanted");
    char const* keys[] = {key.c_str(), nullptr};
    hearing.listener.SwitchOff(hearing.ticket.Type(), hearing.ticket.Id());
    if (hearing.listener.Switch(hearing.ticket.Type(), hearing.ticket.Id(), true, keys) == 0)
        throw Skipped("the plug-in switches no notifications on for the ticket");
    std::fill(key.begin(), key.end(), 'x');
    keys[0] = nullptr;
    hearing.subject.ExpectWrite("V2", Key("Wanted"), Int(1));
    trial.Expect("G2", hearing.listener.AwaitChange(Key("Wanted")).has_value(), "no callback for the key",
                 "one, though the table of keys has gone");
}

void Off(Trial& trial)
{
    Hearing hearing(trial);
    hearing.subject.ExpectWrite("V2", Key("Told"), Int(1));
    trial.Expect("N3", hearing.listener.AwaitChange(Key("Told")).has_value(), "no callback", "one");
    hearing.listener.SwitchOff(hearing.ticket.Type(), hearing.ticket.Id());
    hearing.isOn = false;
    hearing.listener.Forget();
    hearing.subject.ExpectWrite("V2", Key("Told"), Int(2));
    ExpectSilence(trial, "N7", hearing.listener, "after the switching off");
}

void OffTwice(Trial& trial)
{
    Hearing hearing(trial);
    for (int i = 0; i < 3; ++i)
        hearing.listener.SwitchOff(hearing.ticket.Type(), hearing.ticket.Id());
    hearing.listener.SwitchOff(hearing.ticket.Type(), TICKET_ID_ALL);
    hearing.listener.SwitchOn(hearing.ticket.Type(), hearing.ticket.Id());
    hearing.subject.ExpectWrite("V2", Key("Told"), Int(1));
    trial.Expect("N8", hearing.listener.AwaitChange(Key("Told")).has_value(),
                 "no callback after it was on again", "one");
}

void AfterLogout(Trial& trial)
{
    Session writer(trial);
    ScratchTicket const ticket(writer);
    InContainer subject(trial, writer.Container(), ticket.Type(), ticket.Id());
    Session session(trial);
    auto& listener = Listener::Begin(session);
    listener.SwitchOn(ticket.Type(), ticket.Id());
    session.LogOut();
    listener.Forget();
    subject.ExpectWrite("V2", Key("Told"), Int(1));
    ExpectSilence(trial, "N9", listener, "after the logout");
}

void OfOthers(Trial& trial)
{
    Session writer(trial);
    ScratchTicket const ticket(writer);
    InContainer subject(trial, writer.Container(), ticket.Type(), ticket.Id());
    Session session(trial);
    auto& listener = Listener::Begin(session);
    listener.SwitchOn(ticket.Type(), TICKET_ID_ALL);
    subject.ExpectWrite("V2", Key("Told"), Int(1));
    trial.Expect("N10", listener.AwaitChange(Key("Told")).has_value(),
                 "no callback for another session's change", "one");
    listener.SwitchOff(ticket.Type(), TICKET_ID_ALL);
}
}  // namespace

std::vector<Check> NotificationChecks()
{
    return {
        {"notifications.register", Register},
        {"notifications.change", Change},
        {"notifications.one-key-pointer", OneKeyPointer},
        {"notifications.order", Order},
        {"notifications.keys", OnlyTheKeys},
        {"notifications.keeps-no-keys", KeepsNoKeys},
        {"notifications.off", Off},
        {"notifications.off-twice", OffTwice},
        {"notifications.after-logout", AfterLogout},
        {"notifications.of-others", OfOthers},
    };
}
}  // namespace validate
