// Records between their forms: this library's typed objects against libprotobuf's messages (generated classes
// and dynamic ones, both on an arena that is kept) and against RapidJSON's untyped trees. Reading takes in
// the end of the tree, writing the allocation of what is written. All read the same bytes and the same text,
// but for libprotobuf's JSON, whose names and values have a form of their own: its rate is in bytes of that.
#include <benchmark/benchmark.h>
#include <malloc.h>

#include <memory>
#include <string>
#include <utility>
#include <vector>

#include "codecs/Libraries.h"
#include "codecs/Records.h"

namespace {

using bench::Peer;
using bench::RapidJson;
using bench::Record;
using bench::Records;
using bench::Sorn;
using benchmark::State;

/// Runs `work` for each record and counts nBytes a round.
template <class Work>
void Measure(State& state, const Records& records, size_t nBytes, Work work) {
    for (auto _ : state) {
        for (const Record& record : records.All()) {
            if (!work(record)) state.SkipWithError("a record was refused");
        }
    }
    state.SetBytesProcessed(static_cast<int64_t>(state.iterations()) * static_cast<int64_t>(nBytes));
}

/// The same over trees that are ready: `work` gives what it wrote.
template <class Trees, class Work>
void MeasureTrees(State& state, const Trees& trees, size_t nBytes, Work work) {
    for (auto _ : state) {
        for (const auto& tree : trees) benchmark::DoNotOptimize(work(tree));
    }
    state.SetBytesProcessed(static_cast<int64_t>(state.iterations()) * static_cast<int64_t>(nBytes));
}

/// The name is WORK/DATA/LIBRARY; report.py takes it apart.
template <class Run>
benchmark::internal::Benchmark* Register(const std::string& work, const Records& records,
                                         const std::string& library, Run run) {
    return benchmark::RegisterBenchmark((work + "/" + records.Name() + "/" + library).c_str(), run);
}

void RegisterSorn(const Records& records) {
    Register("binary to object", records, "sorn", [&records](State& state) {
        RoxMempool pool("bench");
        Sorn sorn(pool);
        Measure(state, records, records.BinaryBytes(),
                [&sorn](const Record& record) { return sorn.FromBinary(record) != nullptr; });
    });
    Register("text to object", records, "sorn", [&records](State& state) {
        RoxMempool pool("bench");
        Sorn sorn(pool);
        Measure(state, records, records.TextBytes(),
                [&sorn](const Record& record) { return sorn.FromText(record) != nullptr; });
    });
    Register("object to binary", records, "sorn", [&records](State& state) {
        RoxMempool pool("bench");
        Sorn sorn(pool);
        Measure(state, records, records.BinaryBytes(),
                [&sorn](const Record& record) { return sorn.ToBinary(record.object) != nullptr; });
    });
    Register("object to text", records, "sorn", [&records](State& state) {
        RoxMempool pool("bench");
        Sorn sorn(pool);
        Measure(state, records, records.TextBytes(),
                [&sorn](const Record& record) { return sorn.WriteText(record.object) != 0; });
    });
}

void RegisterPeer(const Records& records, Peer::Form form, const std::string& library) {
    Register("binary to object", records, library, [&records, form](State& state) {
        Peer peer(form);
        Measure(state, records, records.BinaryBytes(), [&peer](const Record& record) {
            const bool isGood = peer.FromBinary(record) != nullptr;
            peer.Done();
            return isGood;
        });
    });
    Register("object to binary", records, library, [&records, form](State& state) {
        Peer peer(form);
        std::vector<Peer::Tree> trees;
        for (const Record& record : records.All()) trees.push_back(peer.FromBinary(record));
        MeasureTrees(state, trees, records.BinaryBytes(),
                     [](Peer::Tree tree) { return Peer::ToBinary(*tree); });
    });
    if (form != Peer::Form::GENERATED) return;
    Register("text to object", records, library, [&records, form](State& state) {
        Peer peer(form);
        Measure(state, records, records.PeerTextBytes(), [&peer](const Record& record) {
            const bool isGood = peer.FromText(record) != nullptr;
            peer.Done();
            return isGood;
        });
    });
    Register("object to text", records, library, [&records, form](State& state) {
        Peer peer(form);
        std::vector<Peer::Tree> trees;
        for (const Record& record : records.All()) trees.push_back(peer.FromBinary(record));
        MeasureTrees(state, trees, records.PeerTextBytes(),
                     [](Peer::Tree tree) { return Peer::WriteText(*tree); });
    });
}

void RegisterRapidJson(const Records& records) {
    Register("text to object", records, "RapidJSON", [&records](State& state) {
        Measure(state, records, records.TextBytes(),
                [](const Record& record) { return !RapidJson::FromText(record).HasParseError(); });
    });
    Register("object to text", records, "RapidJSON", [&records](State& state) {
        std::vector<RapidJson::Tree> trees;
        for (const Record& record : records.All()) trees.push_back(RapidJson::FromText(record));
        MeasureTrees(state, trees, records.TextBytes(), &RapidJson::WriteText);
    });
}

/// What all records of a set take while they live, one after the other: counted, not timed.
void RegisterMemoryOfSorn(const Records& records) {
    Register("memory", records, "sorn", [&records](State& state) {
        size_t nBytes = 0;
        for (auto _ : state) {
            for (const Record& record : records.All()) {
                RoxMempool pool("bench");
                const Sorn::Tree tree = Sorn(pool).FromBinary(record);
                nBytes += pool.GetUsedBytes();
            }
        }
        state.counters["bytes"] = static_cast<double>(nBytes);
    })->Iterations(1);
}

void RegisterMemoryOfPeer(const Records& records, Peer::Form form, const std::string& library) {
    Register("memory", records, library, [&records, form](State& state) {
        // One block for all, so that what the heap gives meanwhile is texts.
        Peer peer(form, 256 << 20);
        size_t nBytes = 0;
        for (auto _ : state) {
            for (const Record& record : records.All()) {
                const size_t nBefore = mallinfo2().uordblks;
                peer.FromBinary(record);
                nBytes += peer.ArenaBytes() + mallinfo2().uordblks - nBefore;
                peer.Done();
            }
        }
        state.counters["bytes"] = static_cast<double>(nBytes);
    })->Iterations(1);
}

}  // namespace

int main(int argc, char** argv) {
    benchmark::Initialize(&argc, argv);
    if (benchmark::ReportUnrecognizedArguments(argc, argv)) return 2;
    std::vector<std::unique_ptr<Records>> all;
    all.push_back(std::make_unique<Records>("examples", bench::ExampleLines()));
    all.push_back(std::make_unique<Records>("5 KiB", bench::ListOfRecords(5 << 10)));
    all.push_back(std::make_unique<Records>("500 KiB", bench::ListOfRecords(500 << 10)));
    all.push_back(std::make_unique<Records>("5 MiB", bench::ListOfRecords(5 << 20)));
    for (const std::unique_ptr<Records>& records : all) {
        RegisterSorn(*records);
        for (const auto& [form, library] : {std::pair(Peer::Form::GENERATED, "libprotobuf"),
                                            {Peer::Form::ONEOF, "libprotobuf oneof"},
                                            {Peer::Form::DYNAMIC, "libprotobuf dynamic"}}) {
            RegisterPeer(*records, form, library);
            if (form != Peer::Form::DYNAMIC) RegisterMemoryOfPeer(*records, form, library);
        }
        RegisterRapidJson(*records);
        RegisterMemoryOfSorn(*records);
    }
    benchmark::RunSpecifiedBenchmarks();
    benchmark::Shutdown();
    return 0;
}
