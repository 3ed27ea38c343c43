// The summary JSON is written piece by piece; a reader must not tell it from nlohmann's own
// dump(1) of the same document: nesting, empty containers, escaped keys, streamed members in
// their sorted place among whole ones.
#include <gtest/gtest.h>

#include <nlohmann/json.hpp>
#include <sstream>
#include <string>

#include "tools/insight/JsonStreamWriter.h"

namespace velmora {
namespace {

TEST(JsonStreamWriterTest, LaysOutADocumentAsDumpDoes) {
    const nlohmann::json rows = {{{"from_ms", 0.0}, {"value", "300000"}, {"held_by", "initial"}},
                                 {{"from_ms", 1.5}, {"value", "a\"b"}, {"held_by", "KX"}}};
    const nlohmann::json head = {
        {"key", "cpu.big.max"},
        {"changes", 2},
        {"numeric", true},
        {"residency", nlohmann::json::array()},
        {"zeta", {{"nested", {1, 2}}, {"empty", nlohmann::json::object()}}}};
    nlohmann::json expected = {{"calls", 3}, {"trace_ms", 12.25}, {"warnings", nullptr}};
    expected["nodes"] = {head, head};
    expected["nodes"][0]["holders"] = rows;
    expected["nodes"][1]["holders"] = nlohmann::json::array();
    expected["spans"] = nlohmann::json::array();
    expected["we\"ird\nkey"] = "x";

    std::ostringstream out;
    JsonStreamWriter writer(out);
    const nlohmann::json members = {
        {"calls", 3}, {"trace_ms", 12.25}, {"warnings", nullptr}, {"we\"ird\nkey", "x"}};
    auto nodes = [&] {
        writer.beginArray();
        for (int node = 0; node < 2; ++node) {
            writer.object(head, {{"holders", [&] {
                                      writer.beginArray();
                                      for (size_t i = 0; node == 0 && i < rows.size(); ++i)
                                          writer.value(rows[i]);
                                      writer.endArray();
                                  }}});
        }
        writer.endArray();
    };
    auto spans = [&] {
        writer.beginArray();
        writer.endArray();
    };
    writer.object(members, {{"nodes", nodes}, {"spans", spans}});
    EXPECT_EQ(expected.dump(1), out.str());
}

TEST(JsonStreamWriterTest, ObjectsOfOnlyStreamedOrOnlyWholeMembers) {
    std::ostringstream out;
    JsonStreamWriter writer(out);
    writer.beginArray();
    writer.object(nlohmann::json::object(),
                  {{"b", [&] { writer.value(2); }}, {"a", [&] { writer.value("one"); }}});
    writer.object({{"k", {1}}}, {});
    writer.object(nlohmann::json::object(), {});
    writer.value(nullptr);
    writer.endArray();
    const nlohmann::json expected = {
        {{"a", "one"}, {"b", 2}}, {{"k", {1}}}, nlohmann::json::object(), nullptr};
    EXPECT_EQ(expected.dump(1), out.str());
}

}  // namespace
}  // namespace velmora
