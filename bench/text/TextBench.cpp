// JSON text into a fresh tree and out of a ready one: this library's dictionaries against the trees of two
// peers. All read the same bytes, and every rate is in those bytes, though the texts that they write differ
// in their blanks. Reading takes in the destruction of the tree, writing that of the text.
#include <benchmark/benchmark.h>
#include <rapidjson/document.h>
#include <rapidjson/stringbuffer.h>
#include <rapidjson/writer.h>

#include <nlohmann/json.hpp>

#include "common/Bodies.h"
#include "rox/RoxMempool.h"
#include "rox/RoxString.h"
#include "sorn/dict/Dictionary.h"

namespace {

class Sorn {
 public:
    using Tree = ref<sorn::Dictionary>;

    Tree Parse(const std::string& text) {
        RoxString error;
        return sorn::Dictionary::FromJson(reinterpret_cast<const unsigned char*>(text.data()),
                                          static_cast<unsigned>(text.size()), error, &poolM);
    }
    static bool FGood(const Tree& tree) { return tree != nullptr; }
    static size_t Dump(const Tree& tree) {
        const RoxString text = tree->ToJson(false);
        benchmark::DoNotOptimize(text.Utf8());
        return text.NByte();
    }

 private:
    RoxMempool poolM{"bench"};
};

class Nlohmann {
 public:
    using Tree = nlohmann::json;

    static Tree Parse(const std::string& text) { return nlohmann::json::parse(text, nullptr, false); }
    static bool FGood(const Tree& tree) { return !tree.is_discarded(); }
    static size_t Dump(const Tree& tree) {
        const std::string text = tree.dump();
        benchmark::DoNotOptimize(text.data());
        return text.size();
    }
};

class RapidJson {
 public:
    using Tree = rapidjson::Document;

    static Tree Parse(const std::string& text) {
        rapidjson::Document document;
        document.Parse(text.data(), text.size());
        return document;
    }
    static bool FGood(const Tree& tree) { return !tree.HasParseError(); }
    static size_t Dump(const Tree& tree) {
        rapidjson::StringBuffer text;
        rapidjson::Writer<rapidjson::StringBuffer> writer(text);
        tree.Accept(writer);
        benchmark::DoNotOptimize(text.GetString());
        return text.GetSize();
    }
};

using bench::Bodies;

void CountBytes(benchmark::State& state, const Bodies& bodies) {
    state.SetBytesProcessed(static_cast<int64_t>(state.iterations()) *
                            static_cast<int64_t>(bench::CountBytes(bodies)));
}

template <class Library>
void Parse(benchmark::State& state, const Bodies& bodies) {
    Library library;
    for (auto _ : state) {
        for (const std::string& body : bodies) {
            const typename Library::Tree tree = library.Parse(body);
            if (!Library::FGood(tree)) state.SkipWithError("the text was refused");
        }
    }
    CountBytes(state, bodies);
}

template <class Library>
void Dump(benchmark::State& state, const Bodies& bodies) {
    Library library;
    std::vector<typename Library::Tree> trees;
    for (const std::string& body : bodies) trees.push_back(library.Parse(body));
    for (auto _ : state) {
        for (const typename Library::Tree& tree : trees) benchmark::DoNotOptimize(Library::Dump(tree));
    }
    CountBytes(state, bodies);
}

template <class Library>
void Register(const std::string& library, const std::string& data, const Bodies& bodies) {
    // The name is WORK/DATA/LIBRARY; report.py takes it apart.
    benchmark::RegisterBenchmark(("text to tree/" + data + "/" + library).c_str(),
                                 [&bodies](benchmark::State& state) { Parse<Library>(state, bodies); });
    benchmark::RegisterBenchmark(("tree to text/" + data + "/" + library).c_str(),
                                 [&bodies](benchmark::State& state) { Dump<Library>(state, bodies); });
}

}  // namespace

int main(int argc, char** argv) {
    const std::pair<std::string, Bodies> inputs[] = {
        {"examples", bench::ExampleLines()},
        {"5 KiB", bench::ListOfRecords(5 << 10)},
        {"500 KiB", bench::ListOfRecords(500 << 10)},
        {"5 MiB", bench::ListOfRecords(5 << 20)},
    };
    for (const auto& [data, bodies] : inputs) {
        Register<Sorn>("sorn", data, bodies);
        Register<Nlohmann>("nlohmann-json", data, bodies);
        Register<RapidJson>("RapidJSON", data, bodies);
    }
    benchmark::Initialize(&argc, argv);
    if (benchmark::ReportUnrecognizedArguments(argc, argv)) return 2;
    benchmark::RunSpecifiedBenchmarks();
    benchmark::Shutdown();
    return 0;
}
