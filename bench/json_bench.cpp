// Compares jsonvalue with nlohmann-json, jsoncpp, RapidJSON, Boost.JSON and simdjson on three
// classes of documents (the three large bench documents; five small ones of 84 bytes to 1 KB,
// in bench/documents; two number-heavy ones made here, a GeoJSON collection with long
// coordinate arrays and a mesh of short floats and integers): compact and pretty writing into a
// std::string, parsing into the document model, deep copying, destruction, and the heap held by a
// parsed document. simdjson takes part in parsing and compact writing only: its DOM is read-only,
// so there is nothing to copy. jsonvalue's own writing with the common two-space layout, and its
// event writer against RapidJSON's, both fed the events of one walk over a parsed jsonvalue
// document, are measured too; so are validation without building anything (against RapidJSON's
// Reader with a handler that does nothing and UTF-8 validation, and nlohmann's SAX parser with such
// a handler), and parsing with exact numbers against the default parse, on canada.json as jsonvalue
// writes it (as it comes, most of its numbers have more digits than a double keeps, so it is
// refused).
#include <json/json.hpp>

#include <benchmark/benchmark.h>
#include <boost/json.hpp>
#include <json/json.h> // jsoncpp
#include <malloc.h>
#include <nlohmann/json.hpp>
#include <rapidjson/document.h>
#include <rapidjson/prettywriter.h>
#include <rapidjson/reader.h>
#include <rapidjson/stringbuffer.h>
#include <rapidjson/writer.h>
#include <simdjson.h>

#include <algorithm>
#include <cstdint>
#include <cstdio>
#include <fstream>
#include <memory>
#include <sstream>
#include <stdexcept>
#include <string>
#include <string_view>
#include <vector>

namespace {

// One adapter per library, all with the same operations. Input is what parse reads (the text,
// prepared once before timing); an operation whose has_ flag is false is not registered.
struct JsonValue {
    using Document = json::Value;
    using Input = std::string;
    static constexpr const char* name = "jsonvalue";
    static constexpr bool has_compact = true;
    static constexpr bool has_pretty = true;
    static constexpr bool has_copy = true;
    // twitter.json holds 64-bit ids, which a double rounds: asked for by name, as every peer
    // here rounds them (or keeps them) without being asked.
    static json::ParseOptions rounding() {
        json::ParseOptions options;
        options.allow_inexact_integers = true;
        return options;
    }
    static std::unique_ptr<Document> parse(const std::string& text) {
        auto document = std::make_unique<Document>();
        if (!json::parse(text, *document, rounding())) {
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
    using Input = std::string;
    static constexpr const char* name = "nlohmann";
    static constexpr bool has_compact = true;
    static constexpr bool has_pretty = true;
    static constexpr bool has_copy = true;
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
    using Input = std::string;
    static constexpr const char* name = "rapidjson";
    static constexpr bool has_compact = true;
    static constexpr bool has_pretty = true;
    static constexpr bool has_copy = true;
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
    using Input = std::string;
    static constexpr const char* name = "boostjson";
    static constexpr bool has_compact = true;
    static constexpr bool has_pretty = false; // Boost.JSON has no pretty writer
    static constexpr bool has_copy = true;
    static std::unique_ptr<Document> parse(const std::string& text) {
        return std::make_unique<Document>(boost::json::parse(text));
    }
    static std::string compact(const Document& document) {
        return boost::json::serialize(document);
    }
    static std::unique_ptr<Document> copy(const Document& document) {
        return std::make_unique<Document>(document);
    }
};

struct JsonCpp {
    using Document = Json::Value;
    using Input = std::string;
    static constexpr const char* name = "jsoncpp";
    static constexpr bool has_compact = true;
    static constexpr bool has_pretty = true;
    static constexpr bool has_copy = true;
    static std::unique_ptr<Document> parse(const std::string& text) {
        // The reader is made once: building it parses its settings, which is not the
        // document's work.
        static const std::unique_ptr<Json::CharReader> reader(
            Json::CharReaderBuilder().newCharReader());
        auto document = std::make_unique<Document>();
        std::string errors;
        if (!reader->parse(text.data(), text.data() + text.size(), document.get(), &errors)) {
            throw std::runtime_error("jsoncpp refused a benchmark document: " + errors);
        }
        return document;
    }
    // FastWriter is jsoncpp's fastest compact writer (faster than StreamWriterBuilder with an
    // empty indentation, which goes through an ostringstream). It always escapes non-ASCII
    // characters as \u sequences; the other writers here copy UTF-8 through.
    static std::string compact(const Document& document) {
        Json::FastWriter writer;
        writer.omitEndingLineFeed();
        return writer.write(document);
    }
    static std::string pretty(const Document& document) {
        static const Json::StreamWriterBuilder builder = [] {
            Json::StreamWriterBuilder settings;
            settings["indentation"] = "    ";
            settings["commentStyle"] = "None"; // the documents have none
            settings["emitUTF8"] = true;       // UTF-8 copied through, as the others do
            return settings;
        }();
        return Json::writeString(builder, document);
    }
    static std::unique_ptr<Document> copy(const Document& document) {
        return std::make_unique<Document>(document);
    }
};

// A simdjson document is a parser (which owns the tape and the strings) and the root element
// in it. Each parse makes a new parser, as the other libraries make a new document; keeping
// one parser for all parses measures the same on these documents.
struct SimdJson {
    struct Document {
        simdjson::dom::parser parser;
        simdjson::dom::element root;
    };
    using Input = simdjson::padded_string;
    static constexpr const char* name = "simdjson";
    static constexpr bool has_compact = true;
    static constexpr bool has_pretty = false; // no pretty writer
    static constexpr bool has_copy = false;   // a read-only DOM: nothing to copy or destroy
    static std::unique_ptr<Document> parse(const simdjson::padded_string& text) {
        auto document = std::make_unique<Document>();
        if (document->parser.parse(text).get(document->root) != simdjson::SUCCESS) {
            throw std::runtime_error("simdjson refused a benchmark document");
        }
        return document;
    }
    static std::string compact(const Document& document) {
        return simdjson::to_string(document.root);
    }
};

// Hands `handler` the events of a walk over `value`, members in key order (the benchmark
// documents hold no Undefined and no float).
template <typename Handler>
void walk(const json::Value& value, Handler& handler) {
    switch (value.which()) {
    case json::detail::NULL_INDEX:
        handler.null();
        break;
    case json::detail::BOOL_INDEX:
        handler.boolean(boost::get<bool>(value));
        break;
    case json::detail::DOUBLE_INDEX:
        handler.number(boost::get<double>(value));
        break;
    case json::detail::STRING_INDEX:
        handler.string(boost::get<std::string>(value));
        break;
    case json::detail::ARRAY_INDEX:
        handler.begin_array();
        for (const json::Value& item : boost::get<json::Array>(value)) {
            walk(item, handler);
        }
        handler.end_array();
        break;
    case json::detail::OBJECT_INDEX:
        handler.begin_object();
        for (const auto& [key, member] : boost::get<json::Object>(value)) {
            handler.key(key);
            walk(member, handler);
        }
        handler.end_object();
        break;
    default:
        throw std::runtime_error("a benchmark document holds Undefined or a float");
    }
}

// RapidJSON's Writer under the event names of json::Writer.
class RapidJsonEvents {
  public:
    explicit RapidJsonEvents(rapidjson::StringBuffer& buffer) : writer(buffer) {}
    void null() { writer.Null(); }
    void boolean(bool value) { writer.Bool(value); }
    void number(double value) { writer.Double(value); }
    void string(std::string_view text) {
        writer.String(text.data(), static_cast<rapidjson::SizeType>(text.size()));
    }
    void key(std::string_view text) {
        writer.Key(text.data(), static_cast<rapidjson::SizeType>(text.size()));
    }
    void begin_array() { writer.StartArray(); }
    void end_array() { writer.EndArray(); }
    void begin_object() { writer.StartObject(); }
    void end_object() { writer.EndObject(); }

  private:
    rapidjson::Writer<rapidjson::StringBuffer> writer;
};

std::string write_events_with_jsonvalue(const json::Value& document) {
    std::string text;
    json::Writer writer(text);
    walk(document, writer);
    return text;
}

std::string write_events_with_rapidjson(const json::Value& document) {
    rapidjson::StringBuffer buffer;
    RapidJsonEvents events(buffer);
    walk(document, events);
    return std::string(buffer.GetString(), buffer.GetSize());
}

// A SAX handler for nlohmann's parser that accepts everything and keeps nothing.
struct NlohmannNullHandler : nlohmann::json_sax<nlohmann::json> {
    bool null() override { return true; }
    bool boolean(bool) override { return true; }
    bool number_integer(number_integer_t) override { return true; }
    bool number_unsigned(number_unsigned_t) override { return true; }
    bool number_float(number_float_t, const string_t&) override { return true; }
    bool string(string_t&) override { return true; }
    bool binary(binary_t&) override { return true; }
    bool start_object(std::size_t) override { return true; }
    bool key(string_t&) override { return true; }
    bool end_object() override { return true; }
    bool start_array(std::size_t) override { return true; }
    bool end_array() override { return true; }
    bool parse_error(std::size_t, const std::string&, const nlohmann::detail::exception&) override {
        return false;
    }
};

bool validate_with_jsonvalue(const std::string& text) {
    return static_cast<bool>(json::validate(text, JsonValue::rounding()));
}

bool validate_with_rapidjson(const std::string& text) {
    rapidjson::Reader reader;
    rapidjson::BaseReaderHandler<> handler;
    rapidjson::StringStream stream(text.c_str());
    return !reader.Parse<rapidjson::kParseValidateEncodingFlag>(stream, handler).IsError();
}

bool validate_with_nlohmann(const std::string& text) {
    NlohmannNullHandler handler;
    return nlohmann::json::sax_parse(text, &handler);
}

std::string read_file(const std::string& path) {
    std::ifstream file(path, std::ios::binary);
    if (!file) {
        throw std::runtime_error("cannot read " + path);
    }
    std::ostringstream text;
    text << file.rdbuf();
    return text.str();
}

void count_bytes(benchmark::State& state, const std::string& text, std::size_t batch = 1) {
    state.SetBytesProcessed(static_cast<std::int64_t>(state.iterations()) *
                            static_cast<std::int64_t>(batch * text.size()));
}

// How many documents an iteration that pauses the timer handles: enough for 16 KiB of text.
// Pausing and resuming costs a few hundred nanoseconds, more than parsing a small document:
// one document per pause would measure the timer more than the library.
std::size_t batch_for(const std::string& text) {
    constexpr std::size_t bytes_per_pause = 16384;
    return std::max<std::size_t>(1, bytes_per_pause / std::max<std::size_t>(1, text.size()));
}

// The documents are parsed once per library before any timing and kept for the whole run.
template <typename Library>
void register_library(const std::string& document_name, const std::string& text) {
    const auto input = std::make_shared<const typename Library::Input>(text);
    const std::shared_ptr<const typename Library::Document> parsed = Library::parse(*input);
    const std::string suffix = "/" + document_name + "/" + Library::name;

    if constexpr (Library::has_compact) {
        benchmark::RegisterBenchmark(("compact" + suffix).c_str(), [parsed, text](auto& state) {
            for (auto _ : state) {
                benchmark::DoNotOptimize(Library::compact(*parsed));
            }
            count_bytes(state, text);
        });
    }
    if constexpr (Library::has_pretty) {
        benchmark::RegisterBenchmark(("pretty" + suffix).c_str(), [parsed, text](auto& state) {
            for (auto _ : state) {
                benchmark::DoNotOptimize(Library::pretty(*parsed));
            }
            count_bytes(state, text);
        });
    }
    const std::size_t batch = batch_for(text);
    benchmark::RegisterBenchmark(("parse" + suffix).c_str(), [input, text, batch](auto& state) {
        std::vector<decltype(Library::parse(*input))> documents(batch);
        for (auto _ : state) {
            for (auto& document : documents) {
                document = Library::parse(*input);
            }
            state.PauseTiming();
            for (auto& document : documents) {
                document.reset();
            }
            state.ResumeTiming();
        }
        count_bytes(state, text, batch);
    });
    // Copy, destruction (of a copy) and the heap held are measured on the mutable models.
    if constexpr (Library::has_copy) {
        benchmark::RegisterBenchmark(("copy" + suffix).c_str(), [parsed, text, batch](auto& state) {
            std::vector<decltype(Library::copy(*parsed))> copies(batch);
            for (auto _ : state) {
                for (auto& copy : copies) {
                    copy = Library::copy(*parsed);
                }
                state.PauseTiming();
                for (auto& copy : copies) {
                    copy.reset();
                }
                state.ResumeTiming();
            }
            count_bytes(state, text, batch);
        });
        benchmark::RegisterBenchmark(
            ("destroy" + suffix).c_str(), [parsed, text, batch](auto& state) {
                std::vector<decltype(Library::copy(*parsed))> copies(batch);
                for (auto _ : state) {
                    state.PauseTiming();
                    for (auto& copy : copies) {
                        copy = Library::copy(*parsed);
                    }
                    state.ResumeTiming();
                    for (auto& copy : copies) {
                        copy.reset();
                    }
                }
                count_bytes(state, text, batch);
            });
        // The heap a parsed document holds, as malloc counts it (these libraries allocate
        // through malloc in the end).
        benchmark::RegisterBenchmark(("memory" + suffix).c_str(), [input](auto& state) {
            for (auto _ : state) {
                const std::size_t before = mallinfo2().uordblks;
                auto document = Library::parse(*input);
                state.counters["heap_bytes"] = static_cast<double>(mallinfo2().uordblks - before);
            }
        })->Iterations(1);
    }
}

// jsonvalue's writing with the common two-space layout, and the two event writers fed by a
// walk over one parsed jsonvalue document.
void register_layouts_and_events(const std::string& document_name, const std::string& text) {
    const std::shared_ptr<const json::Value> parsed = JsonValue::parse(text);
    const auto add = [&](const std::string& operation, const std::string& library,
                         std::string (*write)(const json::Value&)) {
        const std::string name = operation + "/" + document_name + "/" + library;
        benchmark::RegisterBenchmark(name.c_str(), [parsed, text, write](auto& state) {
            for (auto _ : state) {
                benchmark::DoNotOptimize(write(*parsed));
            }
            count_bytes(state, text);
        });
    };
    add("common", "jsonvalue",
        [](const json::Value& document) { return json::serialize(document, json::COMMON_PRETTY); });
    add("events", "jsonvalue", write_events_with_jsonvalue);
    add("events", "rapidjson", write_events_with_rapidjson);
}

// Validation, building nothing, by each library that offers it.
void register_validation(const std::string& document_name, const std::string& text) {
    const auto add = [&](const std::string& library, bool (*validate)(const std::string&)) {
        if (!validate(text)) {
            throw std::runtime_error(library + " refused a benchmark document");
        }
        const std::string name = "validate/" + document_name + "/" + library;
        benchmark::RegisterBenchmark(name.c_str(), [text, validate](auto& state) {
            for (auto _ : state) {
                benchmark::DoNotOptimize(validate(text));
            }
            count_bytes(state, text);
        });
    };
    add("jsonvalue", validate_with_jsonvalue);
    add("rapidjson", validate_with_rapidjson);
    add("nlohmann", validate_with_nlohmann);
}

// jsonvalue's parse with ParseOptions::exact_numbers ("exact"), and its default parse, of the
// text jsonvalue writes for a document.
void register_exact_parse(const std::string& document_name, const std::string& written) {
    json::ParseOptions exact;
    exact.exact_numbers = true;
    for (const auto& [operation, options] : {std::pair{std::string("parse"), json::ParseOptions()},
                                             std::pair{std::string("exact"), exact}}) {
        json::Value check;
        if (!json::parse(written, check, options)) {
            throw std::runtime_error("jsonvalue refused its own text of " + document_name);
        }
        const std::string name = operation + "/" + document_name + "/jsonvalue";
        benchmark::RegisterBenchmark(name.c_str(), [written, options = options](auto& state) {
            for (auto _ : state) {
                auto document = std::make_unique<json::Value>();
                json::parse(written, *document, options);
                state.PauseTiming();
                document.reset();
                state.ResumeTiming();
            }
            count_bytes(state, written);
        });
    }
}

// A fixed sequence of numbers in [0, 1), the same on every run.
class Sequence {
  public:
    double next() {
        state = state * 6364136223846793005U + 1442695040888963407U;
        return static_cast<double>(state >> 11U) / 9007199254740992.0;
    }

  private:
    std::uint64_t state = 2026;
};

void append_number(std::string& text, const char* format, double value) {
    char buffer[32];
    text.append(buffer,
                static_cast<std::size_t>(std::snprintf(buffer, sizeof buffer, format, value)));
}

// A GeoJSON FeatureCollection of 150 tracks of 600 points each, coordinates with seven
// decimals as mapping tools write them: about 2 MB.
std::string geojson_tracks() {
    Sequence random;
    std::string text = R"({"type":"FeatureCollection","features":[)";
    for (int track = 0; track < 150; ++track) {
        text += track == 0 ? "" : ",";
        text += R"({"type":"Feature","properties":{"id":)" + std::to_string(track) +
                R"(,"name":"track )" + std::to_string(track) +
                R"("},"geometry":{"type":"LineString","coordinates":[)";
        double longitude = -120 + 240 * random.next();
        double latitude = -60 + 120 * random.next();
        for (int point = 0; point < 600; ++point) {
            longitude += 0.001 * (random.next() - 0.5);
            latitude += 0.001 * (random.next() - 0.5);
            text += point == 0 ? "[" : ",[";
            append_number(text, "%.7f", longitude);
            text += ',';
            append_number(text, "%.7f", latitude);
            text += ']';
        }
        text += "]}}";
    }
    return text + "]}";
}

// A triangle mesh: vertex positions and normals as short floats, faces as integers, as 3D
// exporters write them: about 1 MB.
std::string mesh() {
    Sequence random;
    constexpr int vertices = 20000;
    const auto floats = [&](const char* name, double scale) {
        std::string part = std::string("\"") + name + "\":[";
        for (int i = 0; i < 3 * vertices; ++i) {
            part += i == 0 ? "" : ",";
            append_number(part, "%.4g", scale * (random.next() - 0.5));
        }
        return part + "]";
    };
    std::string text = "{" + floats("positions", 20) + "," + floats("normals", 2) + ",\"faces\":[";
    for (int i = 0; i < 2 * 3 * vertices; ++i) {
        text += (i == 0 ? "" : ",") + std::to_string(static_cast<int>(random.next() * vertices));
    }
    return text + "],\"material\":\"steel\"}";
}

void register_document(const std::string& name, const std::string& text) {
    register_library<JsonValue>(name, text);
    register_library<Nlohmann>(name, text);
    register_library<JsonCpp>(name, text);
    register_library<RapidJson>(name, text);
    register_library<BoostJson>(name, text);
    register_library<SimdJson>(name, text);
}

} // namespace

int main(int argc, char** argv) {
    benchmark::Initialize(&argc, argv);
    for (const char* name : {"twitter", "citm_catalog", "canada"}) {
        const std::string text = read_file(std::string(JSON_BENCH_DATA_DIR) + "/" + name + ".json");
        register_document(name, text);
        register_layouts_and_events(name, text);
        register_validation(name, text);
    }
    for (const char* name : {"rpc_call", "log_event", "geo_feature", "api_page", "package"}) {
        register_document(name,
                          read_file(std::string(JSON_BENCH_DOCUMENTS_DIR) + "/" + name + ".json"));
    }
    register_document("geojson_tracks", geojson_tracks());
    register_document("mesh", mesh());
    register_exact_parse("canada_written",
                         json::serialize(*JsonValue::parse(
                             read_file(std::string(JSON_BENCH_DATA_DIR) + "/canada.json"))));
    benchmark::RunSpecifiedBenchmarks();
    benchmark::Shutdown();
}
