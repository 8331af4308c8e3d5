// Runs a test body under each vector path this processor has, slowest first,
// so that every fast path is checked against the same expectations.
#pragma once

#include <gtest/gtest.h>

#include "bitmap/cpu_features.h"

namespace tstest {

template <class Body>
void ForEachVectorPath(Body &&body) {
    using tessarine::VectorPath;
    struct Restore {
        VectorPath cap;
        ~Restore() { tessarine::LimitVectorPaths(cap); }
    } restore{tessarine::LimitVectorPaths(VectorPath::kPlain)};
    const int fastest = static_cast<int>(tessarine::ProcessorVectorPath());
    for (int path = 0; path <= fastest; ++path) {
        SCOPED_TRACE(::testing::Message() << "vector path " << path);
        tessarine::LimitVectorPaths(static_cast<VectorPath>(path));
        body();
        if (::testing::Test::HasFatalFailure()) return;
    }
}

}  // namespace tstest
