// What a notification costs: a table of a thousand changed keys on its road through the queue, beside the
// same step by step, and beside the blocks of memory alone that it takes; the texts by themselves; and the
// append to the queue with four threads at it, against one alone.
#include "bench/counted_loop.h"
#include "bench/ratio_report.h"
#include "comgui/access/FromUtf8.h"

#include <comgui/comgui.h>

#include <benchmark/benchmark.h>
#include <cstdlib>
#include <cstring>
#include <list>
#include <string>
#include <vector>

namespace
{
constexpr std::size_t Keys = 1000;

// A thousand keys of some 40 bytes: an int or a double for one half of them, a text for the other.
struct CHANGES
{
    CHANGES()
    {
        for (std::size_t i = 0; i < Keys; ++i)
            names.push_back("System/Configuration/Queues/Entry" + std::to_string(1000 + i) + "/Name");
        for (std::size_t i = 0; i < Keys; ++i)
        {
            PARAM_TYPE const type = i % 4 == 0 ? PARAM_INT : i % 4 == 1 ? PARAM_DOUBLE : PARAM_STRING;
            void const* const value = type == PARAM_INT      ? static_cast<void const*>(&number)
                                      : type == PARAM_DOUBLE ? static_cast<void const*>(&real)
                                                             : "Proof paper 220 g";
            table.push_back({names[i].c_str(), type, 0, value, -1, false, {}});
        }
        table.push_back({});
    }

    int number = 4711;
    double real = 0.125;
    std::vector<std::string> names;
    std::vector<SETMULTIPAR> table;
};

CHANGES& Changes()
{
    static CHANGES changes;
    return changes;
}

void Free(std::list<NotifData*>& queue)
{
    for (NotifData* const notification : queue)
        delete notification;
    queue.clear();
}

// What the library queued so far, out of the queue and freed.
void Drain()
{
    std::list<NotifData*> taken;
    {
        wxCriticalSectionLocker const lock(ComGUIManager::m_csNotificationList);
        taken.swap(ComGUIManager::m_notificationList);
    }
    Free(taken);
}

void Notify(benchmark::State& state)
{
    for (auto _ : COUNTED_LOOP(state))
    {
        ComGUIManager::fGUI2NOTIFICATION(nullptr, 1, 0, 0, 3, Changes().table.data());
        if (ComGUIManager::m_notificationList.size() != Keys)
            return state.SkipWithError("not one notification a key");
        Drain();
    }
}

void NotifyPlainly(benchmark::State& state)
{
    std::list<NotifData*> queue;
    wxCriticalSection section;
    for (auto _ : COUNTED_LOOP(state))
    {
        NotifData const pattern(nullptr, 1, 0, 0, 3, PARAM_NONE, nullptr);
        for (SETMULTIPAR const* record = Changes().table.data(); record->key; ++record)
        {
            auto* const notification = new NotifData(pattern);
            notification->NotifKey = wxString::FromUTF8(record->key);
            notification->NotifValueType = record->type;
            notification->NotifPos = record->pos;
            if (record->type == PARAM_STRING)
                notification->NotifText = wxString::FromUTF8(static_cast<char const*>(record->value));
            else if (record->type == PARAM_DOUBLE)
                notification->NotifNumber = *static_cast<double const*>(record->value);
            else
                notification->NotifNumber = *static_cast<int const*>(record->value);
            wxCriticalSectionLocker const lock(section);
            queue.push_back(notification);
        }
        Free(queue);
    }
}

// A block for the record and its place in a row, one for each text, and the characters in them.
void BlocksAlone(benchmark::State& state)
{
    struct NODE
    {
        NODE* next;
        wchar_t* key;
        wchar_t* text;
        char rest[sizeof(NotifData) - 2 * sizeof(wxString)];
    };
    auto const widen = [](void const* text)
    {
        auto const* const from = static_cast<char const*>(text);
        std::size_t const size = std::strlen(from) + 1;
        auto* const to = static_cast<wchar_t*>(std::malloc(size * sizeof(wchar_t)));
        for (std::size_t i = 0; i < size; ++i)
            to[i] = static_cast<unsigned char>(from[i]);
        return to;
    };
    for (auto _ : COUNTED_LOOP(state))
    {
        NODE* first = nullptr;
        for (SETMULTIPAR const* record = Changes().table.data(); record->key; ++record)
        {
            auto* const node = static_cast<NODE*>(std::malloc(sizeof(NODE)));
            node->next = first;
            node->key = widen(record->key);
            node->text = record->type == PARAM_STRING ? widen(record->value) : nullptr;
            first = node;
        }
        benchmark::DoNotOptimize(first);
        while (NODE* const node = first)
        {
            first = node->next;
            std::free(node->key);
            std::free(node->text);
            std::free(node);
        }
    }
}

template <typename CONVERT>
void Texts(benchmark::State& state, CONVERT convert)
{
    for (auto _ : COUNTED_LOOP(state))
        for (std::string const& name : Changes().names)
            benchmark::DoNotOptimize(convert(name.c_str()));
}

void Append(benchmark::State& state)
{
    int sinceDrain = 0;
    for (auto _ : COUNTED_LOOP(state))
    {
        ComGUIManager::fGUI2NOTIFICATION(nullptr, 4, 0, 0, 3, nullptr);
        if (++sinceDrain == 10000)
        {
            sinceDrain = 0;
            state.PauseTiming();
            Drain();
            state.ResumeTiming();
        }
    }
    state.SetItemsProcessed(state.iterations());
    if (state.thread_index() == 0)
        Drain();
}
}  // namespace

int main(int argc, char** argv)
{
    benchmark::RegisterBenchmark("Notify/comgui", Notify);
    benchmark::RegisterBenchmark("Notify/plain", NotifyPlainly);
    benchmark::RegisterBenchmark("Notify/floor", BlocksAlone);
    benchmark::RegisterBenchmark("Texts/comgui",
                                 [](benchmark::State& state) { Texts(state, comgui::detail::FromUtf8); });
    benchmark::RegisterBenchmark("Texts/wxwidgets",
                                 [](benchmark::State& state) {
                                     Texts(state, [](char const* text) { return wxString::FromUTF8(text); });
                                 });
    benchmark::RegisterBenchmark("Append", Append)->ThreadRange(1, 4)->UseRealTime();
    return RunAndReport(argc, argv,
                        {{"1,000 notifications", "Notify/comgui", "Notify/plain", 0.4},
                         {"1,000 notifications", "Notify/comgui", "Notify/floor", 2},
                         {"1,000 keys as texts", "Texts/comgui", "Texts/wxwidgets", 0.3}});
}
