// A program outside the project, built against the installed package.
#include <json/json.hpp>

#include <iostream>

int main() {
    json::Object document;
    document["installed"] = true;
    document["list"] = json::Array{1, "two"};
    const std::string text = json::serialize(document);
    std::cout << text << '\n';
    return text == R"({"installed":true,"list":[1,"two"]})" ? 0 : 1;
}
