// A program of a project that builds jsonvalue as part of its own tree: a document parsed,
// changed and written, with the version from the header that jsonvalue's build generates.
#include <json/json.hpp>

#include <iostream>

int main() {
    json::Value document;
    if (json::parse(R"({"embedded": true, "list": [1, 2]})", document) !=
        json::ParseResult::SUCCESS) {
        return 1;
    }
    document.at("list").as_array().push_back(JSONVALUE_VERSION_STRING);
    const std::string text = json::serialize(document);
    std::cout << text << '\n';
    return text == R"({"embedded":true,"list":[1,2,")" JSONVALUE_VERSION_STRING R"("]})" ? 0 : 1;
}
