// What it costs to write a ticket's records as a stream and to read it into a list, beside the formats that
// could stand in its place: the same records in the same run, each format used as it is fastest. For figures
// to go by, on a quiet machine and with a release build:
//
//   taskset -c 1 stream_bench --benchmark_repetitions=9 --benchmark_enable_random_interleaving=true
#include "bench/counted_loop.h"
#include "bench/peers/peer.h"
#include "bench/ratio_report.h"

#include <benchmark/benchmark.h>
#include <cstring>
#include <malloc.h>
#include <string>

namespace
{
struct FORMAT
{
    char const* name;
    std::unique_ptr<PEER> (*make)();
};

struct RECORDS
{
    char const* name;
    WORKLOAD& (*get)();
};

bool ReadsBack(PEER& peer, WORKLOAD& records)
{
    COMPARISON comparison(records.Table());
    peer.Tell(peer.Write(records.Table()), comparison);
    return comparison.Equal();
}

void SetCounters(benchmark::State& state, WORKLOAD const& records, std::size_t bytes)
{
    auto const count = static_cast<double>(records.Size());
    state.counters["time_a_record"] = benchmark::Counter(
        count, benchmark::Counter::kIsIterationInvariantRate | benchmark::Counter::kInvert);
    state.counters[BytesARecord] = static_cast<double>(bytes) / count;
}

void Write(benchmark::State& state, RECORDS workload, FORMAT format)
{
    WORKLOAD& records = workload.get();
    std::unique_ptr<PEER> const peer = format.make();
    if (!ReadsBack(*peer, records))
        return state.SkipWithError("what was written does not read back");
    std::size_t const size = peer->Write(records.Table()).size();
    for (auto _ : COUNTED_LOOP(state))
        benchmark::DoNotOptimize(peer->Write(records.Table()).data());
    SetCounters(state, records, size);
}

void Read(benchmark::State& state, RECORDS workload, FORMAT format)
{
    WORKLOAD& records = workload.get();
    std::unique_ptr<PEER> const peer = format.make();
    std::string const bytes(peer->Write(records.Table()));
    if (!ReadsBack(*peer, records) || peer->Read(bytes) == 0)
        return state.SkipWithError("what was written does not read back");
    for (auto _ : COUNTED_LOOP(state))
        benchmark::DoNotOptimize(peer->Read(bytes));
    SetCounters(state, records, bytes.size());
}

std::size_t HeapInUse()
{
    struct mallinfo2 const heap = mallinfo2();
    return heap.uordblks + heap.hblkhd;
}

// Reads and keeps; what is kept is counted, rounding of the heap included.
void Keep(benchmark::State& state, RECORDS workload, FORMAT format)
{
    WORKLOAD& records = workload.get();
    std::unique_ptr<PEER> const peer = format.make();
    std::string const bytes(peer->Write(records.Table()));
    std::size_t kept = 0;
    for (auto _ : COUNTED_LOOP(state))
    {
        std::size_t const before = HeapInUse();
        std::shared_ptr<void> const found = peer->Keep(bytes);
        if (!found)
            return state.SkipWithError("what was written does not read back");
        kept = HeapInUse() - before + (peer->KeepsBytes() ? bytes.size() : 0);
    }
    SetCounters(state, records, kept);
}

// The floor of Write: the same bytes, copied.
void Copy(benchmark::State& state, RECORDS workload)
{
    WORKLOAD& records = workload.get();
    std::unique_ptr<PEER> const peer = MakeComgui();
    std::string_view const bytes = peer->Write(records.Table());
    std::string copy(bytes);
    for (auto _ : COUNTED_LOOP(state))
    {
        std::memcpy(copy.data(), bytes.data(), bytes.size());
        benchmark::ClobberMemory();
    }
    SetCounters(state, records, bytes.size());
}

void RegisterRead(RECORDS workload, FORMAT format)
{
    std::string const name = std::string(workload.name) + "/" + format.name;
    benchmark::RegisterBenchmark(("Read/" + name).c_str(), Read, workload, format);
    benchmark::RegisterBenchmark(("Keep/" + name).c_str(), Keep, workload, format);
}

void RegisterWrite(RECORDS workload, FORMAT format)
{
    std::string const name = std::string("Write/") + workload.name + "/" + format.name;
    benchmark::RegisterBenchmark(name.c_str(), Write, workload, format);
}

void Register(RECORDS workload, FORMAT format)
{
    RegisterWrite(workload, format);
    RegisterRead(workload, format);
}

void RegisterAll()
{
    for (RECORDS const workload :
         {RECORDS{"job", JobTicket}, RECORDS{"system", SystemTicket}, RECORDS{"vector", BigVector}})
    {
        benchmark::RegisterBenchmark((std::string("Write/") + workload.name + "/memcpy").c_str(), Copy,
                                     workload);
        for (FORMAT const format : {FORMAT{"comgui", MakeComgui}, FORMAT{"protobuf", MakeProtobuf},
                                    FORMAT{"msgpack", MakeMsgpack}, FORMAT{"ipp", MakeIpp}})
            Register(workload, format);
        RegisterWrite(workload, {"msgpack_buffer", MakeMsgpackBuffer});
        RegisterRead(workload, {"protobuf_heap", MakeProtobufHeap});
    }
    Register({"vector", BigVector}, {"protobuf_each", MakeProtobufEach});
    RegisterRead({"vector", BigVector}, {"protobuf_each_heap", MakeProtobufEachHeap});
}
}  // namespace

int main(int argc, char** argv)
{
    RegisterAll();
    return RunAndReport(
        argc, argv,
        {{"write, job ticket", "Write/job/comgui", "Write/job/msgpack", 0.60},
         {"write, job ticket", "Write/job/comgui", "Write/job/msgpack_buffer", 0.85},
         {"write, job ticket", "Write/job/comgui", "Write/job/protobuf", 0.75},
         {"write, system ticket", "Write/system/comgui", "Write/system/protobuf", 0.75},
         {"write, big vector", "Write/vector/comgui", "Write/vector/msgpack", 0.85},
         {"write, big vector", "Write/vector/comgui", "Write/vector/msgpack_buffer", 1.1},
         {"read, job ticket", "Read/job/comgui", "Read/job/protobuf_heap", 0.30},
         {"read, job ticket", "Read/job/comgui", "Read/job/protobuf", 0.35},
         {"read, job ticket", "Read/job/comgui", "Read/job/msgpack", 2.00},
         {"read, job ticket", "Read/job/comgui", "Read/job/ipp", 0.10},
         {"read, system ticket", "Read/system/comgui", "Read/system/protobuf_heap", 0.35},
         {"read, system ticket", "Read/system/comgui", "Read/system/protobuf", 0.35},
         {"read, system ticket", "Read/system/comgui", "Read/system/ipp", 0.06},
         {"read, big vector", "Read/vector/comgui", "Read/vector/ipp", 0.40},
         {"read, big vector", "Read/vector/comgui", "Read/vector/protobuf_each_heap", 0.30},
         {"read, big vector", "Read/vector/comgui", "Read/vector/protobuf_each", 0.30},
         {"bytes a record, job ticket", "Write/job/comgui", "Write/job/msgpack", 0.63, GOAL::BYTES_A_RECORD},
         {"bytes a record, big vector", "Write/vector/comgui", "Write/vector/msgpack", 1.09,
          GOAL::BYTES_A_RECORD},
         {"bytes a record, system ticket", "Write/system/comgui", "Write/system/msgpack", 0.49,
          GOAL::BYTES_A_RECORD},
         {"memory, job ticket", "Keep/job/comgui", "Keep/job/msgpack", 2.5, GOAL::BYTES_A_RECORD},
         {"memory, job ticket", "Keep/job/comgui", "Keep/job/protobuf_heap", 1.8, GOAL::BYTES_A_RECORD},
         {"memory, system ticket", "Keep/system/comgui", "Keep/system/msgpack", 2.5, GOAL::BYTES_A_RECORD},
         {"memory, system ticket", "Keep/system/comgui", "Keep/system/protobuf_heap", 1.6,
          GOAL::BYTES_A_RECORD},
         {"memory, big vector", "Keep/vector/comgui", "Keep/vector/msgpack", 1.4, GOAL::BYTES_A_RECORD}});
}
