// Prints what the session layer computes from a recording, as the C++ library says it. The tests of the bindings
// compare their own numbers with it: session_numbers RECORDING EDITS

#include "Bindings/Tables/SessionTables.h"
#include "Reports/Text.h"

#include <nlohmann/json.hpp>

#include <cmath>
#include <cstdint>
#include <iostream>
#include <string>
#include <variant>
#include <vector>

using namespace ZULMetaData;
using namespace ZULMetaData::Bindings;
using Json = nlohmann::ordered_json;

namespace {

Json jsonOf(double value) {
    return std::isfinite(value) ? Json(value) : Json();
}

Json jsonOf(std::int32_t value) {
    return value;
}

Json jsonOf(std::uint64_t value) {
    return std::to_string(value);
}

Json jsonOf(const Text& text) {
    return text ? Json(Zulm::validText(*text)) : Json();
}

Json jsonOf(const Blob& bytes) {
    return bytes ? Json(*bytes) : Json();
}

template <class Value>
Json arrayOf(const std::vector<Value>& values) {
    Json array = Json::array();
    for (const Value& value : values)
        array.push_back(jsonOf(value));
    return array;
}

Json jsonOf(const Table& table) {
    Json json{{"time", arrayOf(table.times)}};
    for (const TableColumn& column : table.columns)
        json[column.name] = std::visit([](const auto& values) { return arrayOf(values); }, column.values);
    return json;
}

std::vector<double> askedTimes() {
    std::vector<double> times{-1, 0};
    for (int i = 0; i < 500; ++i)
        times.push_back(i * 0.0371);
    return times;
}

} // namespace

int main(int count, char** arguments) {
    if (count != 3)
        return 2;
    const Recording recording{FileLocation(arguments[1])};
    const std::vector<double> times = askedTimes();
    Json document{{"times", times}};
    document["states"] = jsonOf(statesTable(recording, times, Interpolation::Linear));
    document["held"] = jsonOf(statesTable(recording, times, Interpolation::Held));
    for (const char* name : insightNames())
        document["insights"][name] = jsonOf(insightTable(recording, name, {}));
    document["least_3"] = jsonOf(insightTable(recording, "idle", {{"least", 3}}));
    document["retimed"] = jsonOf(retimedTable(recording, {arguments[2]}));
    std::cout << document << '\n';
    return 0;
}
