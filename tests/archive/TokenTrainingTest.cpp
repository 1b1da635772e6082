#include <gtest/gtest.h>

#include <algorithm>
#include <string>

#include "archive/TokenTraining.hpp"

namespace tessel::archive {
namespace {

SegmentList trainingList() {
    SegmentList list;
    for (int i = 0; i < 3000; ++i) {
        std::string path = "share/doc/package-";
        path += std::to_string(i / 10);
        path += "/chapter-";
        path += std::to_string(i % 10);
        path += ".html";
        list.add(SplitPath::of(path));
    }
    return list;
}

// Steps that the list is cut into at this level.
std::size_t stepsAt(ArchiveLevel level, std::vector<double>* shares = nullptr) {
    const SegmentList list = trainingList();
    Workers workers(2, {});
    const FrontCoder coder(list, arrange(list, workers), workers);
    const TrainedParse trained =
        trainAndParse(coder, level, workers, [&](double share) {
            if (shares != nullptr) shares->push_back(share);
        });
    std::size_t steps = 0;
    for (const auto& chunk : trained.parsed.chunks) steps += chunk.size();
    return steps;
}

TEST(TokenTrainingTest, LearnedTokensCoverMostOfEachPiece) {
    for (const auto level :
         {ArchiveLevel::Fast, ArchiveLevel::Normal, ArchiveLevel::Best})
        EXPECT_LT(stepsAt(level), 3U * 3000) << static_cast<int>(level);
}

TEST(TokenTrainingTest, ProgressEndsWithAll) {
    std::vector<double> shares;
    stepsAt(ArchiveLevel::Best, &shares);
    EXPECT_TRUE(std::ranges::is_sorted(shares));
    EXPECT_EQ(shares.back(), 1);
}

TEST(TokenTrainingTest, WhatProgressThrowsEndsIt) {
    const SegmentList list = trainingList();
    Workers workers(2, {});
    const FrontCoder coder(list, arrange(list, workers), workers);
    EXPECT_THROW(trainAndParse(coder, ArchiveLevel::Normal, workers,
                               [](double) { throw CancelledException(); }),
                 CancelledException);
}

}  // namespace
}  // namespace tessel::archive
