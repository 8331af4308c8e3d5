// The one cap on the vector paths: it never lifts a path above the
// processor's, and kPlain turns every fast path off.
#include <gtest/gtest.h>

#include <algorithm>

#include "bitmap/cpu_features.h"

namespace {

using tessarine::ActiveVectorPath;
using tessarine::LimitVectorPaths;
using tessarine::ProcessorVectorPath;
using tessarine::VectorPath;

TEST(VectorPaths, AllThatTheProcessorHasUntilCapped) {
    EXPECT_EQ(ActiveVectorPath(), ProcessorVectorPath());
}

TEST(VectorPaths, CapTurnsPathsOffAndReturnsThePreviousCap) {
    EXPECT_EQ(LimitVectorPaths(VectorPath::kPlain), VectorPath::kPermute);
    EXPECT_EQ(ActiveVectorPath(), VectorPath::kPlain);
    EXPECT_EQ(LimitVectorPaths(VectorPath::kShuffle), VectorPath::kPlain);
    EXPECT_EQ(ActiveVectorPath(), std::min(VectorPath::kShuffle, ProcessorVectorPath()));
    EXPECT_EQ(LimitVectorPaths(VectorPath::kPermute), VectorPath::kShuffle);
    EXPECT_EQ(ActiveVectorPath(), ProcessorVectorPath());
}

}  // namespace
