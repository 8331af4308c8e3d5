// Records the sizes handed to the out-of-memory hook while it lives.
#pragma once

#include <cstdint>
#include <vector>

#include <tessarine/platform.h>

namespace tstest {

class OutOfMemoryRecorder {
  public:
    OutOfMemoryRecorder() {
        Sizes().clear();
        previous_ = TS_SetNewMemoryHandler(&Record);
    }
    ~OutOfMemoryRecorder() { TS_SetNewMemoryHandler(previous_); }
    const std::vector<uint32_t> &Calls() const { return Sizes(); }
    void Clear() { Sizes().clear(); }

  private:
    static std::vector<uint32_t> &Sizes() {
        static std::vector<uint32_t> sizes;
        return sizes;
    }
    static int32_t Record(uint32_t size) {
        Sizes().push_back(size);
        return 77;
    }
    TS_NewMemoryHandlerFn previous_;
};

}  // namespace tstest
