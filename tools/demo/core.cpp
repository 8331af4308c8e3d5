// Numeric helpers, rectangles, matrices and the three pools.
#include <cmath>
#include <cstdio>

#include <tessarine/tessarine.h>

#include "demo.h"

void DemoCore() {
    std::puts("Numeric helpers:");
    std::printf("  ShortRound(2.5) = %d, ShortRound(-2.5) = %d, LongRound(0.4999999995) = %d\n",
                ShortRound(2.5), ShortRound(-2.5), LongRound(0.4999999995));
    std::printf("  EQ(0, 1e-8) = %d, FGT(2, 1, 1) = %d, Distance(0, 0, 3, 4) = %g\n", EQ(0, 1e-8),
                FGT(2, 1, 1), Distance(0, 0, 3, 4));
    double x = 0, y = 0, t = 0, u = 0;
    TwoLineIntersect(0, 0, 2, 2, 0, 2, 2, 0, &x, &y, &t, &u);
    std::printf("  the diagonals of a 2 by 2 square cross at (%g, %g)\n", x, y);

    std::puts("Rectangles and matrices:");
    RECT a, b, both;
    IM_SetRECT(0, 0, 100, 50, &a);
    IM_SetRECT(60, 20, 200, 80, &b);
    const int32_t overlap = IM_FindRECTInt(&a, &b, &both);
    std::printf("  (0,0,100,50) and (60,20,200,80) meet in (%d,%d,%d,%d): %s\n", both.left,
                both.top, both.right, both.bottom, overlap ? "not empty" : "empty");
    double s, c;
    GetSinCos(std::acos(-1.0) / 2, &s, &c);
    const QM quarter = {c, s, -s, c, 0, 0};
    QM_ApplyQmRECT(&quarter, &a);
    std::printf("  turned a quarter: (%d,%d,%d,%d)\n", a.left, a.top, a.right, a.bottom);

    std::puts("Pools:");
    MGR_DARY array;
    MGR_DARYInit(&array);
    if (!TS_FAILED(MGR_DARYStart(&array, sizeof(double), 10))) {
        void *slot = NULL;
        for (int i = 0; i < 25; ++i) MGR_DARYAlloc(&array, &slot);
        std::printf("  growing array: 25 elements handed out, capacity now %d\n", array.capacity);
    }
    MGR_DARYEnd(&array);

    MGR_List pool;
    MGR_ListInit(&pool, 32, 16);
    void *node = NULL;
    for (int i = 0; i < 40; ++i) MGR_ListAlloc(&pool, &node);
    MGR_ListFree(&pool, &node);
    std::printf("  node pool: 40 nodes from %d blocks, %d node free\n", ListNumber(pool.blocks),
                ListNumber(pool.freeList));
    MGR_ListEnd(&pool);

    MGR_SMem arena;
    MSG_SMemInit(&arena, 1000, 0);
    void *piece = NULL;
    MGR_SMemAlloc(&arena, 700, &piece);
    MGR_SMemAlloc(&arena, 400, &piece);
    std::printf("  arena: 700 then 400 bytes in blocks of 1000 use %d blocks, %d bytes wasted\n",
                ListNumber(arena.blocks), arena.wasted);
    MGR_SMemEnd(&arena);
}
