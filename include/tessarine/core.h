/* Core services: statuses and messages, circular lists, memory handles, pools,
   numeric helpers, rectangles and transform matrices. */
#ifndef TESSARINE_CORE_H
#define TESSARINE_CORE_H

#include <stddef.h>
#include <stdint.h>

#include "export.h"
#include "platform.h"

TESSARINE_BEGIN_C

/* ---- Statuses and messages ------------------------------------------- */

/* Shows the text for a status; only the low 16 bits of the argument count. */
TESSARINE_API void ShowStatusMsg(int32_t status);
TESSARINE_API int32_t TO_ShowMessageBox(const char *text);

/* Entry points kept so that callers written for a user-interface layer still
   link. They accept and ignore any arguments. */
#ifdef __cplusplus
#define TESSARINE_ANY_ARGS ...
#else
#define TESSARINE_ANY_ARGS
#endif
TESSARINE_API void TO_AnimateWaitCursor(TESSARINE_ANY_ARGS);
TESSARINE_API void TOPrintf(TESSARINE_ANY_ARGS);
TESSARINE_API void TO_SetProgressBarLeftLabel(TESSARINE_ANY_ARGS);
TESSARINE_API void TO_SetProgressBarRightLabel(TESSARINE_ANY_ARGS);
TESSARINE_API void TO_SetProgressBarStatus(TESSARINE_ANY_ARGS);
TESSARINE_API void func_exit_routine(TESSARINE_ANY_ARGS);
TESSARINE_API void MEM_MoveHHiHdl(TESSARINE_ANY_ARGS);
TESSARINE_API int32_t TO_CmdPeriodStop(TESSARINE_ANY_ARGS);
TESSARINE_API int32_t TO_CutStatusIdle(TESSARINE_ANY_ARGS);
TESSARINE_API int32_t TO_InitProgressBar(TESSARINE_ANY_ARGS);
TESSARINE_API int32_t TO_ReleaseProgressBar(TESSARINE_ANY_ARGS);
TESSARINE_API int32_t TO_SetProgressBarValue(TESSARINE_ANY_ARGS);

/* ---- Circular doubly linked lists -------------------------------------- */

typedef struct ListNode {
    uintptr_t data; /* the owner's word; never touched by the list calls */
    struct ListNode *next;
    struct ListNode *prev;
} ListNode;

typedef int32_t (*ListCompareFn)(ListNode *node, ListNode *current);
typedef int32_t (*ListCopyFn)(ListNode *source, ListNode **copy);
typedef int32_t (*ListReleaseFn)(ListNode **head);

TESSARINE_API int32_t ListAppend(ListNode *node, ListNode **head);
TESSARINE_API int32_t ListInsertHead(ListNode *node, ListNode **head);
TESSARINE_API int32_t ListInsertAfter(ListNode *node, ListNode **cursor);
TESSARINE_API int32_t ListInsertSort(ListCompareFn compare, ListNode *node, ListNode **head);
TESSARINE_API int32_t ListConnect(ListNode *other, ListNode **head);
TESSARINE_API int32_t ListRemove(ListNode *node, ListNode **head);
TESSARINE_API int32_t ListRemoveHead(ListNode **head, ListNode **out);
TESSARINE_API int32_t ListRemoveTail(ListNode **head, ListNode **out);
TESSARINE_API int32_t ListSplit(ListNode **head, ListNode **node);
TESSARINE_API int32_t ListSplitHalf(ListNode *first, ListNode **out);
TESSARINE_API int32_t ListNumber(ListNode *first);
TESSARINE_API int32_t ListReverse(ListNode **head);
TESSARINE_API int32_t FreeEntireList(ListNode **head);
TESSARINE_API int32_t ListCopy(ListCopyFn copy, ListReleaseFn release, ListNode *first, ListNode **out);

/* ---- Memory handles ------------------------------------------------------ */

#define MEM_FLAG_DISCARDABLE 2u /* handles only */
#define MEM_FLAG_ZERO 4u

typedef int32_t (*MEM_SqueezeFn)(uintptr_t element, int32_t argument);

TESSARINE_API MEM_Handle MEM_AllocHdl(uint32_t flags, uint32_t size);
TESSARINE_API void *MEM_AllocPtr(uint32_t flags, uint32_t size);
TESSARINE_API void *MEM_Lock(MEM_Handle handle);
TESSARINE_API int32_t MEM_Unlock(MEM_Handle handle);
TESSARINE_API uint32_t MEM_HdlSize(MEM_Handle handle);
TESSARINE_API MEM_Handle MEM_PurgeHdl(MEM_Handle handle);
TESSARINE_API MEM_Handle MEM_FreeHdl(MEM_Handle block);
TESSARINE_API MEM_Handle MEM_FreePtr(MEM_Handle block);
TESSARINE_API MEM_Handle MEM_ReallocHdl(MEM_Handle handle, uint32_t size);
TESSARINE_API void *MEM_ReallocPtr(void *pointer, uint32_t size);
TESSARINE_API void MEM_Fill(void *destination, int32_t count, int32_t value);
TESSARINE_API void MEM_Copy(const void *source, void *destination, int32_t count);
TESSARINE_API int32_t MEM_InitMemManager(void);
TESSARINE_API int32_t MEM_RegisterSwapElement(uintptr_t element, MEM_SqueezeFn squeeze);
TESSARINE_API int32_t MEM_DeleteSwapElement(uintptr_t element);
TESSARINE_API int32_t MEM_LockSwapElement(uintptr_t element);
TESSARINE_API int32_t MEM_UnlockSwapElement(uintptr_t element);
TESSARINE_API int32_t MEM_SqueezMemory(int32_t argument);

/* ---- Pools and dynamic arrays -------------------------------------------- */

typedef struct MGR_DARY {
    MEM_Handle handle;
    void *base;
    int32_t capacity;
    int32_t used;
    int32_t elementSize;
    int32_t growBy;
} MGR_DARY;

typedef struct MGR_List {
    int32_t elementSize;
    int32_t perBlock;
    uint8_t *current;
    int32_t usedInCurrent;
    ListNode *freeList;
    ListNode *blocks;
} MGR_List;

typedef struct MGR_SMem {
    int32_t blockSize;
    uint8_t *current;
    int32_t usedInCurrent;
    ListNode *blocks;
    int32_t largeThreshold;
    int32_t wasted;
} MGR_SMem;

TESSARINE_API void MGR_DARYInit(MGR_DARY *array);
TESSARINE_API int32_t MGR_DARYStart(MGR_DARY *array, int32_t elementSize, int32_t capacity);
TESSARINE_API int32_t MGR_DARYAlloc(MGR_DARY *array, void **element);
TESSARINE_API int32_t MGR_DARYResize(MGR_DARY *array, int32_t newCapacity);
TESSARINE_API void MGR_DARYEnd(MGR_DARY *array);
TESSARINE_API void MGR_ListInit(MGR_List *pool, int32_t elementSize, int32_t perBlock);
TESSARINE_API int32_t MGR_ListAlloc(MGR_List *pool, void **node);
TESSARINE_API void MGR_ListFree(MGR_List *pool, void **node);
TESSARINE_API int32_t MGR_ListResetOneBlock(MGR_List *pool);
TESSARINE_API void MGR_ListEnd(MGR_List *pool);
TESSARINE_API void MGR_ListReport(MGR_List *pool);
TESSARINE_API void MSG_SMemInit(MGR_SMem *arena, int32_t blockSize, int32_t threshold);
TESSARINE_API int32_t MGR_SMemAlloc(MGR_SMem *arena, int32_t size, void **piece);
TESSARINE_API void MGR_SMemEnd(MGR_SMem *arena);
TESSARINE_API void MGR_SMemReport(MGR_SMem *arena);

/* ---- Numeric helpers ------------------------------------------------------ */

TESSARINE_API int32_t FEQ(double a, double b, double t);
TESSARINE_API int32_t EQ(double a, double b);
TESSARINE_API int32_t FGT(double a, double b, double t);
TESSARINE_API int32_t LEQ(double a, double b);
TESSARINE_API int32_t FLEQ(double a, double b, double t);
TESSARINE_API int32_t GEQ(double a, double b);
TESSARINE_API int32_t FGEQ(double a, double b, double t);
TESSARINE_API int32_t ShortRound(double x);
TESSARINE_API int32_t LongRound(double x);
TESSARINE_API void FloatSwap(double *a, double *b);
TESSARINE_API void ShortSwap(int16_t *a, int16_t *b);
TESSARINE_API void LongSwap(int32_t *a, int32_t *b);
TESSARINE_API int32_t LongABS(int32_t x);
TESSARINE_API int32_t ShortABS(int16_t x);
TESSARINE_API float ABSfloat(float x);
TESSARINE_API double FloatABS(double x);
TESSARINE_API double Square(double x);
TESSARINE_API double RadToDegree(double r);
TESSARINE_API double DegreeToRad(double d);
TESSARINE_API double Distance(double x1, double y1, double x2, double y2);
TESSARINE_API double DistanceSQ(double x1, double y1, double x2, double y2);
TESSARINE_API double BZ_Distptpts(double x1, double y1, double x2, double y2);
TESSARINE_API int32_t EqualPoints(double x1, double y1, double x2, double y2);
TESSARINE_API int32_t ExtentIntExtent(double minX1, double minY1, double maxX1, double maxY1,
                                      double minX2, double minY2, double maxX2, double maxY2);
TESSARINE_API int32_t TwoLineIntersect(double x1, double y1, double x2, double y2, double x3,
                                       double y3, double x4, double y4, double *x, double *y,
                                       double *t, double *u);
TESSARINE_API int32_t PointProjectToLine(double px, double py, double x1, double y1, double x2,
                                         double y2, double *x, double *y);
TESSARINE_API void RotatePoint(double *x, double *y, double cx, double cy, double sine,
                               double cosine);
/* control: x0, y0, x1, y1, x2, y2, x3, y3; coefficients: ax, ay, bx, by, cx, cy, dx, dy. */
TESSARINE_API void Bezier(const double *control, double *coefficients);

/* ---- Rectangles and matrices ---------------------------------------------- */

/* x' = x * a + y * c + e;  y' = x * b + y * d + f */
typedef struct QM {
    double a, b, c, d, e, f;
} QM;

TESSARINE_API void IM_SetRECT(int32_t left, int32_t top, int32_t right, int32_t bottom, RECT *out);
TESSARINE_API int32_t IM_EmptyRECT(const RECT *rect);
TESSARINE_API int32_t IM_FindRECTInt(const RECT *a, const RECT *b, RECT *out);
TESSARINE_API int32_t IM_IsRECTEnclosed(const RECT *inner, const RECT *outer);
TESSARINE_API void IM_UnionRECT(const RECT *a, RECT *b);
TESSARINE_API void IM_ExpandRECT(int32_t amount, RECT *rect);
TESSARINE_API void IM_TranslateRECT(int32_t dx, int32_t dy, RECT *rect);
TESSARINE_API void QM_GetInverseQM(const QM *m, QM *out);
TESSARINE_API void QM_ApplyQmXY(const QM *m, double x, double y, double *outX, double *outY);
TESSARINE_API void QM_ApplyQmPt(const QM *m, double *point);
TESSARINE_API void QM_ApplyQmIntXY(const QM *m, int32_t x, int32_t y, int32_t *outX, int32_t *outY);
TESSARINE_API void QM_ApplyQmRECT(const QM *m, RECT *rect);
TESSARINE_API void GetSinCos(double angle, double *sine, double *cosine);

TESSARINE_END_C

#endif
