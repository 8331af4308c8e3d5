// The list of met points and stretches of one clipping run, kept in
// ascending a0. Records merge when their tA ranges touch within a gap; tB is
// never compared.
#include <cmath>

#include "core/status.h"
#include "curves/clip.h"

namespace tessarine::curves {

namespace {

// Re-merging stops growing the gap after this many rounds; only a list of
// values that never merge (not numbers) could get there.
constexpr int kMostRemerges = 2100;

OverlapRec *Rec(ListNode *node) {
    return reinterpret_cast<OverlapRec *>(node);
}

void TakeStart(OverlapRec *to, const OverlapRec *from) {
    to->a0 = from->a0;
    to->b0 = from->b0;
    to->x0 = from->x0;
    to->y0 = from->y0;
}

void TakeEnd(OverlapRec *to, const OverlapRec *from) {
    to->a1 = from->a1;
    to->b1 = from->b1;
    to->x1 = from->x1;
    to->y1 = from->y1;
}

// The survivor is a stretch if either was; the other record is freed.
void Absorb(OverlapRec *survivor, OverlapRec *gone) {
    if (gone->isRange == 1) survivor->isRange = 1;
    MEM_FreeHdl(gone);
}

void Write(const ClipResult &out, double a, double b, double x, double y) {
    const uint16_t i = *out.count;
    out.tA[i] = a;
    out.tB[i] = b;
    out.pts[i] = BZ_Point{x, y};
    *out.count = static_cast<uint16_t>(i + 1);
}

bool Inner(double v) {
    return !(v < 0.0001 || v > 0.9999);
}

// The ends of a stretch worth reporting: those that lie at the curves' ends,
// or both when a short stretch does not settle it.
void ChooseStretchEnds(const OverlapRec *r, bool *start, bool *end) {
    *start = !Inner(r->a0) || !Inner(r->b0);
    *end = !Inner(r->a1) || !Inner(r->b1);
    if (!*start && !*end) {
        *start = *end = true;
    } else if (*start != *end) {
        const bool shortStretch =
            std::fabs(r->a0 - r->a1) <= 0.02 && std::fabs(r->b0 - r->b1) <= 0.02;
        if (!shortStretch) *start = *end = true;
    }
}

}  // namespace

OverlapRec *NewOverlapRec() {
    return static_cast<OverlapRec *>(MEM_AllocPtr(MEM_FLAG_ZERO, sizeof(OverlapRec)));
}

void InsertOverlapRec(ListNode **head, OverlapRec *n, double gap) {
    if (*head == nullptr) {
        ListAppend(&n->link, head);
        return;
    }
    ListNode *node = *head;
    bool walked = false;
    do {
        if (n->a1 <= Rec(node)->a0) break;
        node = node->next;
        walked = true;
    } while (node != *head);
    OverlapRec *r = Rec(node);
    if (node == *head && !walked) {
        if (std::fabs(n->a1 - r->a0) > gap) {
            ListInsertHead(&n->link, head);
        } else {
            if (n->a0 < r->a0) TakeStart(r, n);
            Absorb(r, n);
        }
        return;
    }
    OverlapRec *pv = Rec(node->prev);
    if (std::fabs(n->a0 - pv->a1) <= gap) {
        if (n->a1 > pv->a1) TakeEnd(pv, n);
        Absorb(pv, n);
        // In a list of one record R is its own predecessor: nothing to bridge.
        if (pv != r && std::fabs(r->a0 - pv->a1) <= gap) {
            if (r->a1 > pv->a1) TakeEnd(pv, r);
            ListRemove(&r->link, head);
            Absorb(pv, r);
        }
    } else if (std::fabs(n->a1 - r->a0) > gap) {
        ListNode *after = &pv->link;
        ListInsertAfter(&n->link, &after);
    } else {
        TakeStart(r, n);
        Absorb(r, n);
    }
}

void RemergeOverlapRecs(ListNode **head, double gap) {
    ListNode *merged = nullptr;
    ListNode *node = nullptr;
    while (*head != nullptr) {
        ListRemoveHead(head, &node);
        InsertOverlapRec(&merged, Rec(node), gap);
    }
    *head = merged;
}

int32_t OverlapRecsToResult(ListNode **head, const ClipResult &out) {
    *out.count = 0;
    if (*head == nullptr) return kOk;
    double gap = 0.0001;
    for (int round = 0; ListNumber(*head) > 7; ++round) {
        if ((gap > 0.055 && ListNumber(*head) > 8) || round >= kMostRemerges) return kErrGeneral;
        gap *= 2;
        RemergeOverlapRecs(head, gap);
    }
    ListNode *node = *head;
    do {
        const OverlapRec *r = Rec(node);
        if (r->isRange == 0) {
            Write(out, r->a0, r->b0, r->x0, r->y0);
        } else {
            bool start = false, end = false;
            ChooseStretchEnds(r, &start, &end);
            if (start) Write(out, r->a0, r->b0, r->x0, r->y0);
            if (end) Write(out, r->a1, r->b1, r->x1, r->y1);
        }
        node = node->next;
    } while (node != *head);
    return kOk;
}

}  // namespace tessarine::curves
