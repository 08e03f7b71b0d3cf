// Summing a field over a large array of records, three ways, one per run, so that each run's
// time and peak memory can be measured on its own (/usr/bin/time -v): with json::RecordReader,
// with a hand-written state machine over json::parse_events, and with json::parse of the whole
// document. Each prints the sum and the number of records, which must agree.
//
//     records_bench generate FILE [MEGABYTES]   writes an array of records (default 200 MB)
//     records_bench records|events|document FILE
#include <json/json.hpp>

#include <charconv>
#include <cstddef>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <fstream>
#include <iostream>
#include <stdexcept>
#include <string>
#include <string_view>

namespace {

// An array of records of about 120 bytes, one to a line.
void generate(const char* path, std::size_t megabytes) {
    std::ofstream out(path, std::ios::binary);
    out << "[\n";
    const std::size_t size = megabytes * 1000 * 1000;
    char record[256];
    for (std::size_t id = 0; static_cast<std::size_t>(out.tellp()) < size; ++id) {
        const int length =
            std::snprintf(record, sizeof record,
                          "%s{\"id\": %zu, \"customer\": \"customer %zu\", \"amount\": %zu.%02zu, "
                          "\"currency\": \"EUR\", \"tags\": [\"retail\", \"web\"], \"paid\": %s}",
                          id == 0 ? "" : ",\n", id, id % 100'000, id % 1000, id % 100,
                          id % 3 == 0 ? "false" : "true");
        out.write(record, length);
    }
    out << "\n]\n";
}

struct Sum {
    double total = 0;
    std::size_t records = 0;
};

Sum with_records(std::istream& in) {
    json::RecordReader reader(in);
    json::Value record;
    Sum sum;
    while (reader.next(record)) {
        sum.total += record.at("amount").as_number();
        ++sum.records;
    }
    if (!reader.report()) {
        throw std::runtime_error(reader.report().message());
    }
    return sum;
}

// The state machine a caller writes to read the same field from the events: the depth, and
// whether the last member name was "amount". A record's members lie at depth 2, and each of
// its values there follows a name.
struct AmountHandler : json::NoOpHandler {
    Sum sum;
    std::size_t depth = 0;
    bool at_amount = false;

    bool key(std::string_view name) {
        at_amount = name == "amount";
        return true;
    }
    bool number(std::string_view literal) {
        if (at_amount && depth == 2) {
            double amount = 0;
            std::from_chars(literal.data(), literal.data() + literal.size(), amount);
            sum.total += amount;
        }
        return true;
    }
    bool begin_object() {
        ++depth;
        return true;
    }
    bool end_object() {
        sum.records += --depth == 1 ? 1 : 0;
        return true;
    }
    bool begin_array() {
        ++depth;
        return true;
    }
    bool end_array() {
        --depth;
        return true;
    }
};

Sum with_events(std::istream& in) {
    AmountHandler handler;
    const json::ParseReport report = json::parse_events(in, handler);
    if (!report) {
        throw std::runtime_error(report.message());
    }
    return handler.sum;
}

Sum with_document(std::istream& in) {
    json::Value document;
    const json::ParseReport report = json::parse(in, document, {});
    if (!report) {
        throw std::runtime_error(report.message());
    }
    Sum sum;
    for (const json::Value& record : document.as_array()) {
        sum.total += record.at("amount").as_number();
        ++sum.records;
    }
    return sum;
}

} // namespace

int main(int argc, char** argv) {
    const std::string_view mode = argc > 2 ? argv[1] : "";
    if (mode == "generate") {
        generate(argv[2], argc > 3 ? std::strtoul(argv[3], nullptr, 10) : 200);
        return 0;
    }
    Sum (*const read)(std::istream&) = mode == "records"    ? with_records
                                       : mode == "events"   ? with_events
                                       : mode == "document" ? with_document
                                                            : nullptr;
    if (read == nullptr) {
        std::cerr << "usage: records_bench generate FILE [MEGABYTES]\n"
                     "       records_bench records|events|document FILE\n";
        return 2;
    }
    std::ifstream in(argv[2], std::ios::binary);
    try {
        const Sum sum = read(in);
        std::printf("%zu records, amounts %.2f\n", sum.records, sum.total);
    } catch (const std::exception& error) {
        std::cerr << argv[2] << ": " << error.what() << '\n';
        return 1;
    }
    return 0;
}
