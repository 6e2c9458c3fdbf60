// What a whole list costs above the table slot that it comes down to: 100,000 doubles, beside one call with a
// table that was made once. And 1,000 texts as a list of variants, beside a vector of them. The module is a
// ticket in memory that looks up each record's key, as a module must.
#include "bench/counted_loop.h"
#include "bench/heap_count.h"
#include "bench/ratio_report.h"

#include <benchmark/benchmark.h>
#include <comgui/comgui.h>
#include <cstdlib>
#include <memory>
#include <string>
#include <string_view>
#include <unordered_map>
#include <vector>

namespace
{
constexpr int JobType = 3;
constexpr int JobId = 1;
constexpr char Numbers[] = "Job/Curve";
constexpr char Texts[] = "Job/Names";
constexpr unsigned long NumberCount = 100000;
constexpr unsigned long TextCount = 1000;

class MEMORY_TICKET
{
public:
    MEMORY_TICKET()
    {
        m_access.Instance = this;
        m_access.MGETPARAMETER = [](void* instance, int, int, char const* key, PARAM_TYPE type, void* value,
                                    int pos) { return Of(instance).Get(key, type, value, pos) ? 1 : 0; };
        m_access.MSETPARAMETER =
            [](void* instance, int, int, char const* key, PARAM_TYPE type, void const* value, int pos)
        { return Of(instance).Set(key, type, value, pos) ? 1 : 0; };
        m_access.MGETMULTIPAR = [](void* instance, int, int, GETMULTIPAR* table)
        {
            for (; table->key; ++table)
                table->ok = Of(instance).Get(table->key, table->type, table->value, table->pos);
            return 1;
        };
        m_access.MSETMULTIPAR = [](void* instance, int, int, SETMULTIPAR* table)
        {
            for (; table->key; ++table)
                table->ok = Of(instance).Set(table->key, table->type, table->value, table->pos);
            return 1;
        };
    }
    MEMORY_TICKET(MEMORY_TICKET const&) = delete;
    MEMORY_TICKET& operator=(MEMORY_TICKET const&) = delete;

    MTICKET_ACCESS const* Access() const { return &m_access; }

private:
    struct VALUE
    {
        PARAM_TYPE type;
        double number;
        std::string text;
    };
    struct HASH
    {
        using is_transparent = void;
        std::size_t operator()(std::string_view key) const { return std::hash<std::string_view>()(key); }
    };

    static MEMORY_TICKET& Of(void* instance) { return *static_cast<MEMORY_TICKET*>(instance); }

    bool Get(std::string_view key, PARAM_TYPE type, void* value, int pos) const
    {
        auto const found = m_values.find(key);
        if (found == m_values.end())
            return false;
        std::vector<VALUE> const& values = found->second;
        if (type == PARAM_COUNT)
            return *static_cast<unsigned long*>(value) = values.size(), true;
        if (type == PARAM_NONE && pos == -1 && values.size() > 1)
            return *static_cast<int*>(value) = PARAM_COUNT, true;
        auto const index = static_cast<std::size_t>(pos == -1 ? 0 : pos);
        if (index >= values.size())
            return false;
        if (type == PARAM_NONE)
            return *static_cast<int*>(value) = values[index].type, true;
        if (type != values[index].type)
            return false;
        if (type == PARAM_DOUBLE)
            *static_cast<double*>(value) = values[index].number;
        else
            *static_cast<char const**>(value) = values[index].text.c_str();
        return true;
    }

    bool Set(std::string_view key, PARAM_TYPE type, void const* value, int pos)
    {
        auto const found = m_values.find(key);
        std::vector<VALUE>& values = found == m_values.end() ? m_values[std::string(key)] : found->second;
        if (pos == -1)
            values.clear();
        if (type == PARAM_DOUBLE)
            values.push_back({type, *static_cast<double const*>(value), {}});
        else
            values.push_back({type, 0, static_cast<char const*>(value)});
        return true;
    }

    MTICKET_ACCESS m_access{};
    std::unordered_map<std::string, std::vector<VALUE>, HASH, std::equal_to<>> m_values;
};

MTICKET_ACCESS const* Ticket()
{
    static MEMORY_TICKET const ticket;
    return ticket.Access();
}

struct FREE
{
    void operator()(void* block) const { std::free(block); }
};

// operation: true when it did what it should.
template <typename Operation>
void Measure(benchmark::State& state, Operation operation)
{
    if (!operation())
        return state.SkipWithError("the operation does not do what it should");
    long const before = BlocksTaken();
    for (auto _ : COUNTED_LOOP(state))
        benchmark::DoNotOptimize(operation());
    state.counters["blocks"] =
        benchmark::Counter(static_cast<double>(BlocksTaken() - before), benchmark::Counter::kAvgIterations);
}

std::vector<double> SomeNumbers()
{
    std::vector<double> numbers(NumberCount);
    for (std::size_t i = 0; i < numbers.size(); ++i)
        numbers[i] = static_cast<double>(i) / 8;
    return numbers;
}

std::vector<wxString> SomeTexts()
{
    std::vector<wxString> texts;
    for (unsigned long i = 0; i < TextCount; ++i)
        texts.push_back(wxString::Format("a name of the job, number %lu", i));
    return texts;
}

void ReadTable(benchmark::State& state)
{
    std::vector<double> const numbers = SomeNumbers();
    MTICKET_MODIFY::Of(Ticket())->SetVectorParameter(JobType, JobId, Numbers, numbers);
    std::vector<double> out(NumberCount);
    std::unique_ptr<GETMULTIPAR[], FREE> const table(NewGetMultipar(NumberCount, Numbers, PARAM_DOUBLE));
    for (std::size_t i = 0; i < NumberCount; ++i)
        table[i].value = &out[i];
    Measure(state,
            [&] { return Ticket()->MGETMULTIPAR(Ticket()->Instance, JobType, JobId, table.get()) != 0; });
    if (out != numbers)
        state.SkipWithError("the table does not give what was written");
}

void ReadVector(benchmark::State& state)
{
    std::vector<double> const numbers = SomeNumbers();
    MTICKET_MODIFY::Of(Ticket())->SetVectorParameter(JobType, JobId, Numbers, numbers);
    std::vector<double> out(NumberCount);
    Measure(state,
            [&] { return MTICKET_READ::Of(Ticket())->GetVectorParameter(JobType, JobId, Numbers, out); });
    if (out != numbers)
        state.SkipWithError("the vector does not hold what was written");
}

void WriteTable(benchmark::State& state)
{
    std::vector<double> const numbers = SomeNumbers();
    std::unique_ptr<SETMULTIPAR[], FREE> const table(NewSetMultipar(NumberCount, Numbers, PARAM_DOUBLE));
    for (std::size_t i = 0; i < NumberCount; ++i)
        table[i].value = &numbers[i];
    Measure(state,
            [&] { return Ticket()->MSETMULTIPAR(Ticket()->Instance, JobType, JobId, table.get()) != 0; });
}

void WriteVector(benchmark::State& state)
{
    std::vector<double> const numbers = SomeNumbers();
    Measure(state, [&]
            { return MTICKET_MODIFY::Of(Ticket())->SetVectorParameter(JobType, JobId, Numbers, numbers); });
}

void ReadTexts(benchmark::State& state)
{
    std::vector<wxString> const texts = SomeTexts();
    MTICKET_MODIFY::Of(Ticket())->SetVectorParameter(JobType, JobId, Texts, texts);
    std::vector<wxString> out;
    Measure(state,
            [&]
            {
                out.clear();
                return MTICKET_READ::Of(Ticket())->GetVectorParameter(JobType, JobId, Texts, out);
            });
    if (out != texts)
        state.SkipWithError("the vector does not hold what was written");
}

wxVariant VariantsOf(std::vector<wxString> const& texts)
{
    wxVariant list;
    list.NullList();
    list.SetName(Texts);
    for (wxString const& text : texts)
        list.Append(wxVariant(text));
    return list;
}

void ReadVariants(benchmark::State& state)
{
    std::vector<wxString> const texts = SomeTexts();
    MTICKET_MODIFY::Of(Ticket())->SetVectorParameter(JobType, JobId, Texts, texts);
    wxVariant const defaults = VariantsOf(std::vector<wxString>(TextCount));
    auto const read = [&]
    { return MTICKET_READ::Of(Ticket())->GetWxVariantParameterDef(JobType, JobId, defaults, -1); };
    Measure(state, [&] { return read().GetCount() == TextCount; });
    if (read() != VariantsOf(texts))
        state.SkipWithError("the list does not hold what was written");
}

// What a list of as many variants costs by itself: nothing is read for it.
void MakeVariants(benchmark::State& state)
{
    std::vector<wxString> const texts = SomeTexts();
    wxString const name = Texts;
    Measure(state,
            [&]
            {
                wxVariant list;
                list.NullList();
                for (wxString const& text : texts)
                    list.GetList().Append(new wxVariant(text, name));
                return list.GetCount() == TextCount;
            });
}

void WriteTexts(benchmark::State& state)
{
    std::vector<wxString> const texts = SomeTexts();
    Measure(state,
            [&] { return MTICKET_MODIFY::Of(Ticket())->SetVectorParameter(JobType, JobId, Texts, texts); });
}

void WriteVariants(benchmark::State& state)
{
    wxVariant const list = VariantsOf(SomeTexts());
    Measure(state, [&]
            { return MTICKET_MODIFY::Of(Ticket())->SetWxVariantParameter(JobType, JobId, Texts, list, -1); });
}
}  // namespace

int main(int argc, char** argv)
{
    benchmark::RegisterBenchmark("Read/doubles/table", ReadTable);
    benchmark::RegisterBenchmark("Read/doubles/vector", ReadVector);
    benchmark::RegisterBenchmark("Write/doubles/table", WriteTable);
    benchmark::RegisterBenchmark("Write/doubles/vector", WriteVector);
    benchmark::RegisterBenchmark("Read/texts/vector", ReadTexts);
    benchmark::RegisterBenchmark("Read/texts/variants", ReadVariants);
    benchmark::RegisterBenchmark("Read/texts/floor", MakeVariants);
    benchmark::RegisterBenchmark("Write/texts/vector", WriteTexts);
    benchmark::RegisterBenchmark("Write/texts/variants", WriteVariants);
    return RunAndReport(
        argc, argv,
        {{"read 100,000 doubles", "Read/doubles/vector", "Read/doubles/table", 1.5},
         {"write 100,000 doubles", "Write/doubles/vector", "Write/doubles/table", 1.5},
         {"read 1,000 texts as variants", "Read/texts/variants", "Read/texts/floor", 1.6},
         {"write 1,000 texts as variants", "Write/texts/variants", "Write/texts/vector", 3.0}});
}
