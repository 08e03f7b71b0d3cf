// Compares jsonvalue with nlohmann-json, RapidJSON and Boost.JSON on three documents: compact
// and pretty writing into a std::string, parsing into the document model, deep copying,
// destruction, and the heap held by a parsed document.
#include <json/json.hpp>

#include <benchmark/benchmark.h>
#include <boost/json.hpp>
#include <malloc.h>
#include <nlohmann/json.hpp>
#include <rapidjson/document.h>
#include <rapidjson/prettywriter.h>
#include <rapidjson/stringbuffer.h>
#include <rapidjson/writer.h>

#include <fstream>
#include <memory>
#include <sstream>
#include <stdexcept>
#include <string>
#include <vector>

namespace {

// One adapter per library, all with the same operations.
struct JsonValue {
    using Document = json::Value;
    static constexpr const char* name = "jsonvalue";
    static constexpr bool has_pretty = true;
    static std::unique_ptr<Document> parse(const std::string& text) {
        auto document = std::make_unique<Document>();
        if (json::parse(text, *document) != json::ParseResult::SUCCESS) {
            throw std::runtime_error("jsonvalue refused a benchmark document");
        }
        return document;
    }
    static std::string compact(const Document& document) { return json::serialize(document); }
    static std::string pretty(const Document& document) { return json::pretty_print(document); }
    static std::unique_ptr<Document> copy(const Document& document) {
        return std::make_unique<Document>(document);
    }
};

struct Nlohmann {
    using Document = nlohmann::json;
    static constexpr const char* name = "nlohmann";
    static constexpr bool has_pretty = true;
    static std::unique_ptr<Document> parse(const std::string& text) {
        return std::make_unique<Document>(Document::parse(text));
    }
    static std::string compact(const Document& document) { return document.dump(); }
    static std::string pretty(const Document& document) { return document.dump(4); }
    static std::unique_ptr<Document> copy(const Document& document) {
        return std::make_unique<Document>(document);
    }
};

struct RapidJson {
    using Document = rapidjson::Document;
    static constexpr const char* name = "rapidjson";
    static constexpr bool has_pretty = true;
    static std::unique_ptr<Document> parse(const std::string& text) {
        auto document = std::make_unique<Document>();
        document->Parse(text.c_str(), text.size());
        if (document->HasParseError()) {
            throw std::runtime_error("RapidJSON refused a benchmark document");
        }
        return document;
    }
    template <typename Writer>
    static std::string write(const Document& document, Writer& writer,
                             rapidjson::StringBuffer& buffer) {
        document.Accept(writer);
        return std::string(buffer.GetString(), buffer.GetSize());
    }
    static std::string compact(const Document& document) {
        rapidjson::StringBuffer buffer;
        rapidjson::Writer<rapidjson::StringBuffer> writer(buffer);
        return write(document, writer, buffer);
    }
    static std::string pretty(const Document& document) {
        rapidjson::StringBuffer buffer;
        rapidjson::PrettyWriter<rapidjson::StringBuffer> writer(buffer);
        writer.SetIndent(' ', 4);
        return write(document, writer, buffer);
    }
    static std::unique_ptr<Document> copy(const Document& document) {
        auto copy = std::make_unique<Document>();
        copy->CopyFrom(document, copy->GetAllocator());
        return copy;
    }
};

struct BoostJson {
    using Document = boost::json::value;
    static constexpr const char* name = "boostjson";
    static constexpr bool has_pretty = false; // Boost.JSON has no pretty writer
    static std::unique_ptr<Document> parse(const std::string& text) {
        return std::make_unique<Document>(boost::json::parse(text));
    }
    static std::string compact(const Document& document) {
        return boost::json::serialize(document);
    }
    static std::string pretty(const Document&) { return {}; }
    static std::unique_ptr<Document> copy(const Document& document) {
        return std::make_unique<Document>(document);
    }
};

std::string read_file(const std::string& path) {
    std::ifstream file(path, std::ios::binary);
    if (!file) {
        throw std::runtime_error("cannot read " + path);
    }
    std::ostringstream text;
    text << file.rdbuf();
    return text.str();
}

void count_bytes(benchmark::State& state, const std::string& text) {
    state.SetBytesProcessed(static_cast<std::int64_t>(state.iterations()) *
                            static_cast<std::int64_t>(text.size()));
}

// The documents are parsed once per library before any timing and kept for the whole run.
template <typename Library>
void register_library(const std::string& document_name, const std::string& text) {
    const std::shared_ptr<const typename Library::Document> parsed = Library::parse(text);
    const std::string suffix = "/" + document_name + "/" + Library::name;

    benchmark::RegisterBenchmark(("compact" + suffix).c_str(), [parsed, text](auto& state) {
        for (auto _ : state) {
            benchmark::DoNotOptimize(Library::compact(*parsed));
        }
        count_bytes(state, text);
    });
    if (Library::has_pretty) {
        benchmark::RegisterBenchmark(("pretty" + suffix).c_str(), [parsed, text](auto& state) {
            for (auto _ : state) {
                benchmark::DoNotOptimize(Library::pretty(*parsed));
            }
            count_bytes(state, text);
        });
    }
    benchmark::RegisterBenchmark(("parse" + suffix).c_str(), [text](auto& state) {
        for (auto _ : state) {
            auto document = Library::parse(text);
            state.PauseTiming();
            document.reset();
            state.ResumeTiming();
        }
        count_bytes(state, text);
    });
    benchmark::RegisterBenchmark(("copy" + suffix).c_str(), [parsed, text](auto& state) {
        for (auto _ : state) {
            auto copy = Library::copy(*parsed);
            state.PauseTiming();
            copy.reset();
            state.ResumeTiming();
        }
        count_bytes(state, text);
    });
    benchmark::RegisterBenchmark(("destroy" + suffix).c_str(), [parsed, text](auto& state) {
        for (auto _ : state) {
            state.PauseTiming();
            auto copy = Library::copy(*parsed);
            state.ResumeTiming();
            copy.reset();
        }
        count_bytes(state, text);
    });
    // The heap a parsed document holds, as malloc counts it (all four libraries allocate
    // through malloc in the end).
    benchmark::RegisterBenchmark(("memory" + suffix).c_str(), [text](auto& state) {
        for (auto _ : state) {
            const std::size_t before = mallinfo2().uordblks;
            auto document = Library::parse(text);
            state.counters["heap_bytes"] = static_cast<double>(mallinfo2().uordblks - before);
        }
    })->Iterations(1);
}

} // namespace

int main(int argc, char** argv) {
    benchmark::Initialize(&argc, argv);
    for (const char* name : {"twitter", "citm_catalog", "canada"}) {
        const std::string text = read_file(std::string(JSON_BENCH_DATA_DIR) + "/" + name + ".json");
        register_library<JsonValue>(name, text);
        register_library<Nlohmann>(name, text);
        register_library<RapidJson>(name, text);
        register_library<BoostJson>(name, text);
    }
    benchmark::RunSpecifiedBenchmarks();
    benchmark::Shutdown();
}
