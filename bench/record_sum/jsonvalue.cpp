// The sum of a field over an array of records, written as a user of jsonvalue writes it, for
// comparing its length with nlohmann.cpp's. Usage: record_sum_jsonvalue FILE
#include <json/json.hpp>

#include <fstream>
#include <iostream>

int main(int argc, char** argv) {
    std::ifstream in(argc > 1 ? argv[1] : "", std::ios::binary);
    json::RecordReader reader(in);
    json::Value record;
    double total = 0;
    while (reader.next(record)) {
        total += record.at("amount").as_number();
    }
    if (const json::ParseReport& report = reader.report(); !report) {
        std::cerr << report.line << ':' << report.column << ": " << report.message() << '\n';
        return 1;
    }
    std::cout << total << '\n';
}
