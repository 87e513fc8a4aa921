// Process-wide unique identifiers.
#include <gtest/gtest.h>

#include <algorithm>
#include <functional>
#include <set>
#include <thread>
#include <vector>

#include "zyr/std/core/ZYRUniqueID.h"

TEST(ZYRUniqueIDTest, DistinctAndIncreasingAcrossThreads) {
    constexpr int kPerThread = 1000;
    std::vector<unsigned long long> ids[2];
    auto draw = [](std::vector<unsigned long long>& out) {
        for (int i = 0; i < kPerThread; ++i)
            out.push_back(ZYRStd::createUniqueID());
    };
    std::thread first(draw, std::ref(ids[0]));
    std::thread second(draw, std::ref(ids[1]));
    first.join();
    second.join();

    std::set<unsigned long long> all;
    for (const auto& list : ids) {
        EXPECT_EQ(std::adjacent_find(list.begin(), list.end(), std::greater_equal<>()), list.end())
            << "identifiers of one thread must increase";
        all.insert(list.begin(), list.end());
    }
    EXPECT_EQ(all.size(), 2u * kPerThread);
    EXPECT_GE(*all.begin(), 1u);
    EXPECT_GT(ZYRStd::createUniqueID(), *all.rbegin());
}
