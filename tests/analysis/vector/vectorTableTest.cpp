// The vector table: alignment, growth by 16, release when the last vector goes, the
// message for an unknown address, and allocation from several threads.
#include "analysis/vector/vectorTable.h"

#include <gtest/gtest.h>

#include <cstdint>
#include <thread>
#include <vector>

#include "platform/ui.h"

class VectorTableTest : public ::testing::Test {
protected:
    void SetUp() override {
        ASSERT_EQ(vectorTable.count, 0) << "an earlier test left vectors allocated";
        clearUiCalls();
    }
};

TEST_F(VectorTableTest, VectorsAre64ByteAlignedAndCounted) {
    std::vector<void*> vectors{VF_vector(3), VCF_vector(5), VCD_vector(7)};
    for (void* p : vectors) EXPECT_EQ(reinterpret_cast<uintptr_t>(p) % 64, 0u);
    EXPECT_EQ(vectorTable.count, 3);
    EXPECT_EQ(vectorTable.capacity, 32);
    for (void* p : vectors) V_free(p);
    EXPECT_EQ(messageCount(), 0);
}

TEST_F(VectorTableTest, FreeingAnUnknownAddressShowsTheMessageAndChangesNothing) {
    float* kept = VF_vector(4);
    float* other = VF_vector(4);
    std::vector<void*> before(vectorTable.alignedAddresses, vectorTable.alignedAddresses + vectorTable.count);
    float notAVector = 0;
    V_free(&notAVector);
    V_free(kept + 1);   // inside a vector, but not its address
    EXPECT_EQ(messageCount(), 2);
    EXPECT_EQ(lastMessageText(), "(12) V_free: Cannot free non-existent vector.\n");
    EXPECT_EQ(uiCalls().back().kind, MESSAGE_ERROR);
    EXPECT_EQ(vectorTable.capacity, 32);
    EXPECT_EQ(std::vector<void*>(vectorTable.alignedAddresses, vectorTable.alignedAddresses + vectorTable.count),
              before);
    V_free(kept);
    EXPECT_EQ(vectorTable.alignedAddresses[0], other);
    V_free(other);
    EXPECT_EQ(messageCount(), 2);
}

TEST_F(VectorTableTest, GrowsBySixteenAndStartsAgainWith32AfterTheLastIsFreed) {
    std::vector<float*> vectors;
    for (int i = 0; i < 32; i++) vectors.push_back(VF_vector(2));
    EXPECT_EQ(vectorTable.capacity, 32);
    vectors.push_back(VF_vector(2));
    EXPECT_EQ(vectorTable.capacity, 48);
    for (float* v : vectors) V_free(v);
    EXPECT_EQ(vectorTable.capacity, 0);
    EXPECT_EQ(vectorTable.alignedAddresses, nullptr);
    float* again = VF_vector(2);
    EXPECT_EQ(vectorTable.capacity, 32);
    EXPECT_EQ(vectorTable.count, 1);
    V_free(again);
}

TEST_F(VectorTableTest, ThreadsAllocatingAtOnceLeaveTheTableEmpty) {
    auto work = [] {
        for (int round = 0; round < 500; round++) {
            dComplex* a = VCD_vector(16);
            float* b = VF_vector(100);
            a[15].Re = b[99] = float(round);
            V_free(a);
            V_free(b);
        }
    };
    std::vector<std::thread> threads;
    for (int t = 0; t < 4; t++) threads.emplace_back(work);
    for (std::thread& t : threads) t.join();
    EXPECT_EQ(vectorTable.count, 0);
    EXPECT_EQ(vectorTable.capacity, 0);
    EXPECT_EQ(messageCount(), 0);
}
