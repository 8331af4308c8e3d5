// Reflection of a point in a line. A line of no length reflects through its
// second point, where the perpendicular foot falls then.
#include "geometry/kernel.h"

extern "C" TESSARINE_API int32_t BZ_MirrorPt(const BZ_Point *a, const BZ_Point *b,
                                             BZ_Point *point) {
    BZ_Point foot;
    const int32_t status =
        BZ_Mindistpt2ln(point->x, point->y, a->x, a->y, b->x, b->y, nullptr, nullptr, &foot);
    point->x = 2.0 * foot.x - point->x;
    point->y = 2.0 * foot.y - point->y;
    return status;
}
