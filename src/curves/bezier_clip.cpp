// Where two cubics meet, and whether they lie on each other: pairs of
// sub-curves are quartered and pairs whose oriented frames are apart are
// dropped, until both of a pair are flat; then their chords are intersected.
// Pending pairs lie on a stack of our own, never in recursion.
#include <cmath>
#include <cstring>
#include <initializer_list>

#include "core/status.h"
#include "curves/clip.h"

namespace tessarine::curves {

namespace {

constexpr uint32_t kPairPoints = 10;
constexpr uint32_t kStackStep = 200;
// Beyond these the pairs have stopped separating (a tolerance at or below
// what rounding allows, values that are not numbers): a status, not a hang.
// Runs on finite curves with a workable tolerance stay far below them: the
// stack peaks at a few hundred points, and nearly coincident curves 1e11
// tolerances long take under a million pairs.
constexpr uint32_t kMostStackPoints = 16384;
constexpr uint64_t kMostPairs = 1048576;
// With a tolerance below what the coordinates' rounding can resolve (0 and
// below included) only exactly straight pieces make a leaf: such a run ends
// where its pairs fall apart, which they do early or never.
constexpr uint64_t kMostPairsBelowRounding = 65536;
constexpr double kRounding = 1e-15;

// Whether frames can get thinner than tol: not at or below the rounding of
// the largest coordinate, nor with values that are not numbers.
bool Resolvable(const BZ_Curve &a, const BZ_Curve &b, double tol) {
    const BZ_Point p[8] = {a.p0, a.p1, a.p2, a.p3, b.p0, b.p1, b.p2, b.p3};
    double largest = 0.0;
    for (const BZ_Point &q : p) {
        for (double v : {q.x, q.y}) {
            if (std::isnan(v)) return false;
            if (std::fabs(v) > largest) largest = std::fabs(v);
        }
    }
    return tol > 0 && tol > largest * kRounding;
}
// A piece this narrow is 50 quarterings deep, far below what the rounding
// of any coordinate can tell apart; a run that needs to split it has lost
// its way.
constexpr double kNarrowest = 1e-30;
constexpr uint32_t kBigStack = 190;
constexpr double kLeafGap = 0.001;
constexpr double kSameResult = 0.0001;
constexpr int kMostLocal = 6;

// The pair stack: one block of points, ten a pair, grown 200 points at a time.
class PairStack {
  public:
    ~PairStack() {
        if (points_ != nullptr) MEM_FreeHdl(points_);
    }
    int32_t Start() {
        points_ =
            static_cast<BZ_Point *>(MEM_AllocPtr(MEM_FLAG_ZERO, kStackStep * sizeof(BZ_Point)));
        if (points_ == nullptr) return kErrMemory;
        capacity_ = kStackStep;
        return kOk;
    }
    uint32_t Size() const { return size_; }
    bool Empty() const { return size_ == 0; }
    int32_t Push(const ClipPiece &a, const ClipPiece &b) {
        if (capacity_ - size_ < 20) {
            if (capacity_ + kStackStep > kMostStackPoints) return kErrStackOverflow;
            void *grown = MEM_ReallocPtr(points_, (capacity_ + kStackStep) * sizeof(BZ_Point));
            if (grown == nullptr) {
                points_ = nullptr;  // the heap released the old block
                return kErrMemory;
            }
            points_ = static_cast<BZ_Point *>(grown);
            capacity_ += kStackStep;
        }
        BZ_Point *p = points_ + size_;
        std::memcpy(p, &a.curve, sizeof(BZ_Curve));
        p[4] = BZ_Point{a.t0, a.t1};
        std::memcpy(p + 5, &b.curve, sizeof(BZ_Curve));
        p[9] = BZ_Point{b.t0, b.t1};
        size_ += kPairPoints;
        return kOk;
    }
    void Pop(ClipPiece *a, ClipPiece *b) {
        size_ -= kPairPoints;
        const BZ_Point *p = points_ + size_;
        std::memcpy(&a->curve, p, sizeof(BZ_Curve));
        a->t0 = p[4].x;
        a->t1 = p[4].y;
        std::memcpy(&b->curve, p + 5, sizeof(BZ_Curve));
        b->t0 = p[9].x;
        b->t1 = p[9].y;
    }

  private:
    BZ_Point *points_ = nullptr;
    uint32_t size_ = 0;
    uint32_t capacity_ = 0;
};

struct LocalResult {
    double tA, tB;
    BZ_Point pt;
    int16_t kind;
};

// All the state of one call.
class ClipRun {
  public:
    ClipRun(const BZ_Curve &a, const BZ_Curve &b, const ClipResult &out, double tol, int16_t *kind)
        : wholeA_(a), wholeB_(b), out_(out), tol_(tol), kind_(kind) {}
    ~ClipRun() { FreeEntireList(&list_); }

    int32_t Run(double *curveA, double *curveB);

  private:
    int32_t Leaf(const ClipPiece &a, const ClipPiece &b);
    int32_t SplitA(const ClipPiece &a, const ClipFrame &fb, const ClipPiece &b, bool bFlat);
    int32_t SplitB(const ClipPiece &a, const ClipFrame &fa, const ClipPiece &b);
    int32_t CheckedPush(const ClipPiece &a, const ClipPiece &b);
    int32_t Insert(const LocalResult *first, const LocalResult *second);

    BZ_Curve wholeA_, wholeB_;
    ClipResult out_;
    double tol_;
    int16_t *kind_;
    PairStack stack_;
    ListNode *list_ = nullptr;
    LocalResult local_[kMostLocal] = {};
    int localCount_ = 0;
    bool useList_ = false;
    bool checked_ = false;
    bool stop_ = false;
};

// The big-stack test: once per call, when the pending pairs pile up, ask
// whether the whole curves lie on each other; if so, that is the answer.
int32_t ClipRun::CheckedPush(const ClipPiece &a, const ClipPiece &b) {
    if (!checked_ && stack_.Size() > kBigStack) {
        checked_ = true;
        if (WholeCurvesCoincide(wholeA_, wholeB_, tol_, out_)) {
            stop_ = true;
            return kOk;
        }
    }
    return stack_.Push(a, b);
}

int32_t ClipRun::SplitA(const ClipPiece &a, const ClipFrame &fb, const ClipPiece &b, bool bFlat) {
    if (a.t1 - a.t0 < kNarrowest || (!bFlat && b.t1 - b.t0 < kNarrowest)) return kErrStackOverflow;
    ClipPiece qa[4];
    SplitIntoQuarters(a, qa);
    bool touches[4];
    bool any = false;
    for (int i = 0; i < 4; ++i) any |= touches[i] = FrameTouchesCurve(fb, qa[i].curve);
    if (!any) return kOk;
    ClipPiece qb[4];
    if (!bFlat) SplitIntoQuarters(b, qb);
    for (int i = 0; i < 4; ++i) {
        if (!touches[i]) continue;
        const ClipFrame fq = BuildClipFrame(qa[i].curve);
        if (bFlat) {
            if (!FrameTouchesCurve(fq, b.curve)) continue;
            const int32_t status = CheckedPush(qa[i], b);
            if (Failed(status) || stop_) return status;
            continue;
        }
        for (int j = 0; j < 4; ++j) {
            if (!FrameTouchesCurve(fq, qb[j].curve)) continue;
            const int32_t status = CheckedPush(qa[i], qb[j]);
            if (Failed(status) || stop_) return status;
        }
    }
    return kOk;
}

int32_t ClipRun::SplitB(const ClipPiece &a, const ClipFrame &fa, const ClipPiece &b) {
    if (b.t1 - b.t0 < kNarrowest) return kErrStackOverflow;
    ClipPiece qb[4];
    SplitIntoQuarters(b, qb);
    for (int j = 0; j < 4; ++j) {
        if (!FrameTouchesCurve(fa, qb[j].curve)) continue;
        if (!FrameTouchesCurve(BuildClipFrame(qb[j].curve), a.curve)) continue;
        const int32_t status = CheckedPush(a, qb[j]);
        if (Failed(status) || stop_) return status;
    }
    return kOk;
}

// A point record from one entry, or a stretch from two.
int32_t ClipRun::Insert(const LocalResult *first, const LocalResult *second) {
    OverlapRec *r = NewOverlapRec();
    if (r == nullptr) return kErrMemory;
    const LocalResult *end = second != nullptr ? second : first;
    r->a0 = first->tA;
    r->b0 = first->tB;
    r->x0 = first->pt.x;
    r->y0 = first->pt.y;
    r->a1 = end->tA;
    r->b1 = end->tB;
    r->x1 = end->pt.x;
    r->y1 = end->pt.y;
    r->isRange = second != nullptr ? 1 : 0;
    InsertOverlapRec(&list_, r, kLeafGap);
    return kOk;
}

int32_t ClipRun::Leaf(const ClipPiece &a, const ClipPiece &b) {
    stop_ = false;
    int16_t k = 0;
    const int32_t status =
        NewLineSegSegIntersect(a.curve.p0.x, a.curve.p0.y, a.curve.p3.x, a.curve.p3.y, b.curve.p0.x,
                               b.curve.p0.y, b.curve.p3.x, b.curve.p3.y, a.t0, a.t1, b.t0, b.t1, 1,
                               out_.tA, out_.tB, out_.pts, out_.count, tol_, &k);
    if (Failed(status)) return status;
    if (*kind_ == 0) *kind_ = k;
    if (k == 0) return kOk;
    const LocalResult e0{out_.tA[0], out_.tB[0], out_.pts[0], k};
    LocalResult e1 = e0;
    if (k == 4) e1 = LocalResult{out_.tA[1], out_.tB[1], out_.pts[1], k};

    // Once the list has taken over, every result goes to it at once.
    if (useList_) return k == 4 ? Insert(&e0, &e1) : Insert(&e0, nullptr);
    if (k == 4) {
        if (localCount_ + 2 <= kMostLocal) {
            local_[localCount_++] = e0;
            local_[localCount_++] = e1;
        }
    } else {
        bool known = false;
        for (int i = 0; i < localCount_; ++i)
            known |= FEQ(local_[i].tA, e0.tA, kSameResult) && FEQ(local_[i].tB, e0.tB, kSameResult);
        if (!known && localCount_ < kMostLocal) local_[localCount_++] = e0;
    }
    if (localCount_ <= 1) return kOk;

    // A second result: the coincidence checks have their one chance to end
    // the run before the list takes over.
    useList_ = true;
    double tA[2], tB[2];
    BZ_Point pts[2];
    uint16_t count = 0;
    const ClipResult temp{tA, tB, pts, &count};
    int16_t found = 0;
    if (WholeCurvesCoincide(wholeA_, wholeB_, tol_, temp)) {
        found = 3;
    } else {
        found = FindPartialOverlap(wholeA_, wholeB_, tol_, temp);
    }
    if (found != 0) {
        for (int i = 0; i < 2; ++i) {
            out_.tA[i] = tA[i];
            out_.tB[i] = tB[i];
            out_.pts[i] = pts[i];
        }
        *out_.count = 2;
        *kind_ = found;
        stop_ = true;
        return kOk;
    }
    for (int i = 0; i < localCount_; ++i) {
        const bool stretch = local_[i].kind == 4 && i + 1 < localCount_;
        const int32_t made = Insert(&local_[i], stretch ? &local_[i + 1] : nullptr);
        if (Failed(made)) return made;
        if (stretch) ++i;
    }
    localCount_ = 0;
    return kOk;
}

int32_t ClipRun::Run(double *curveA, double *curveB) {
    int32_t status = stack_.Start();
    if (Failed(status)) return status;
    status = stack_.Push(ClipPiece{wholeA_, 0.0, 1.0}, ClipPiece{wholeB_, 0.0, 1.0});
    if (Failed(status)) return status;
    const uint64_t mostPairs =
        Resolvable(wholeA_, wholeB_, tol_) ? kMostPairs : kMostPairsBelowRounding;
    uint64_t pairs = 0;
    while (!stack_.Empty()) {
        if (++pairs > mostPairs) return kErrStackOverflow;
        ClipPiece a, b;
        stack_.Pop(&a, &b);
        // The caller's curves are the working storage of the pair in hand.
        std::memcpy(curveA, &a.curve, sizeof(BZ_Curve));
        std::memcpy(curveB, &b.curve, sizeof(BZ_Curve));
        const ClipFrame fa = BuildClipFrame(a.curve);
        const ClipFrame fb = BuildClipFrame(b.curve);
        const double wA = fa.dmax - fa.dmin;
        const double wB = fb.dmax - fb.dmin;
        if (wA <= tol_ && wB <= tol_) {
            status = Leaf(a, b);
        } else if (wA > tol_) {
            status = SplitA(a, fb, b, wB <= tol_);
        } else {
            status = SplitB(a, fa, b);
        }
        if (Failed(status) || stop_) return status;
    }
    if (useList_) return OverlapRecsToResult(&list_, out_);
    for (int i = 0; i < localCount_; ++i) {
        out_.tA[i] = local_[i].tA;
        out_.tB[i] = local_[i].tB;
        out_.pts[i] = local_[i].pt;
    }
    *out_.count = static_cast<uint16_t>(localCount_);
    return kOk;
}

}  // namespace

}  // namespace tessarine::curves

extern "C" TESSARINE_API int32_t TOV_Bezier_Clip(double *curveA, double *curveB, double *tA,
                                                 double *tB, BZ_Point *pts, uint16_t *count,
                                                 double tol, int16_t *kind) {
    using namespace tessarine::curves;
    ClipRun run(CurveOf(curveA), CurveOf(curveB), ClipResult{tA, tB, pts, count}, tol, kind);
    return run.Run(curveA, curveB);
}
