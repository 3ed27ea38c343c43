// The spool the timeline keeps its per-call events in: records come back per group in the order
// they went in, whether they sat in memory, in the scratch file or (without one) in memory
// again, and what stays in memory is a chunk per group however many records there are.
#include <gtest/gtest.h>

#include <cstdlib>
#include <string>
#include <vector>

#include "host/record/EventSpool.h"

namespace velmora {
namespace {

constexpr size_t kChunk = 256;

std::vector<std::string> recordsOf(const EventSpool& spool, size_t group,
                                   bool* complete = nullptr) {
    std::vector<std::string> out;
    const bool ok =
        spool.forEach(group, [&](const char* data, size_t size) { out.emplace_back(data, size); });
    if (complete != nullptr)
        *complete = ok;
    return out;
}

// Interleaved records of three groups, enough to fill many chunks; one record bigger than a
// chunk; an empty one.
void fill(EventSpool& spool, std::vector<std::vector<std::string>>* expected) {
    expected->assign(3, {});
    for (int i = 0; i < 2000; ++i) {
        const size_t group = static_cast<size_t>(i % 3 == 0 ? 0 : i % 7 == 0 ? 2 : 1);
        std::string record = "record " + std::to_string(i);
        if (i == 1000)
            record = std::string(3 * kChunk, 'x');
        if (i == 1001)
            record.clear();
        spool.append(group, record);
        (*expected)[group].push_back(record);
    }
}

TEST(EventSpoolTest, GroupsComeBackInOrderFromTheScratchFileWithAChunkEachInMemory) {
    EventSpool spool(kChunk);
    std::vector<std::vector<std::string>> expected;
    fill(spool, &expected);
    for (size_t group = 0; group < 3; ++group) {
        bool complete = false;
        EXPECT_EQ(expected[group], recordsOf(spool, group, &complete)) << group;
        EXPECT_TRUE(complete);
    }
    EXPECT_TRUE(recordsOf(spool, 7).empty());  // a group never written to
    EXPECT_LE(spool.memoryBytes(), 3 * kChunk);
    EXPECT_GT(spool.spooledBytes(), 2000u * 10);
}

TEST(EventSpoolTest, WithoutAScratchFileNothingIsLost) {
    const char* saved = getenv("TMPDIR");
    const std::string before = saved != nullptr ? saved : "";
    setenv("TMPDIR", "/nonexistent/velmora-spool-test", 1);
    EventSpool spool(kChunk);
    std::vector<std::vector<std::string>> expected;
    fill(spool, &expected);
    if (saved != nullptr)
        setenv("TMPDIR", before.c_str(), 1);
    else
        unsetenv("TMPDIR");
    for (size_t group = 0; group < 3; ++group)
        EXPECT_EQ(expected[group], recordsOf(spool, group)) << group;
    EXPECT_EQ(0u, spool.spooledBytes());
    EXPECT_GT(spool.memoryBytes(), 2000u * 10);
}

TEST(EventSpoolTest, ClearForgetsEverythingAndTheFileIsReused) {
    EventSpool spool(kChunk);
    std::vector<std::vector<std::string>> expected;
    fill(spool, &expected);
    spool.clear();
    EXPECT_TRUE(recordsOf(spool, 0).empty());
    EXPECT_EQ(0u, spool.spooledBytes());
    fill(spool, &expected);
    EXPECT_EQ(expected[1], recordsOf(spool, 1));
}

}  // namespace
}  // namespace velmora
