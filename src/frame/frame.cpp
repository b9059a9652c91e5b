#include "frame/frame.hpp"

namespace tw {

void Frame::Register(Handle& h, int32_t type, int32_t dims) {
    for (int i = 0; i < nOuts_; ++i)
        if (outs_[i].handle == &h) return;
    if (nOuts_ < kMax) outs_[nOuts_++] = {&h, type, dims};
}

Status Frame::Stage(Handle* h, const void* src, int32_t dims, size_t bytes, bool writeBack,
                    void** copy) {
    *copy = nullptr;
    if (nStages_ == kMax) return InternalErr;
    if (const Status s = ScratchAlloc(copy, bytes)) return s;
    std::memcpy(*copy, src, bytes);
    stages_[nStages_++] = {*copy, writeBack ? h : nullptr, dims, bytes};
    return 0;
}

Status Frame::ReleaseStages() {
    Status s = 0;
    for (int i = 0; i < nStages_; ++i) s = MergeRelease(s, ScratchFree(stages_[i].copy));
    nStages_ = 0;
    return s;
}

Status Frame::Finish(Status s) {
    if (!Failed(s)) {
        // Nothing has resized the blocks since the views were taken.
        for (int i = 0; i < nStages_; ++i) {
            const struct Stage& st = stages_[i];
            if (st.handle != nullptr)
                std::memcpy(static_cast<unsigned char*>(**st.handle) + 4 * st.dims, st.copy, st.bytes);
        }
    }
    s = MergeRelease(s, ReleaseStages());
    if (!Failed(s)) return s;
    for (int i = 0; i < nOuts_; ++i) {
        Handle& h = *outs_[i].handle;
        if (h == nullptr) continue;
        HostResize(outs_[i].type, outs_[i].dims, &h, 0);
        if (*h != nullptr) std::memset(*h, 0, 4 * static_cast<size_t>(outs_[i].dims));
    }
    for (int i = 0; i < nResults_; ++i)
        for (int32_t k = 0; k < results_[i].n; ++k) results_[i].p[k] = kNaN;
    return s;
}

InstanceRecord* AcquireInstanceRecord(void** cell) {
    if (*cell == nullptr) *cell = PlainZeroAlloc(sizeof(InstanceRecord));
    return static_cast<InstanceRecord*>(*cell);
}

}  // namespace tw
