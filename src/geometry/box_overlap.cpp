// Overlap of two boxes grown by a tolerance; touching counts.
#include "geometry/kernel.h"

extern "C" TESSARINE_API int32_t BZ_BBoxBoxInt(double xmin1, double ymin1, double xmax1,
                                               double ymax1, double xmin2, double ymin2,
                                               double xmax2, double ymax2, double tolerance) {
    return xmin2 <= xmax1 + tolerance && xmin1 <= xmax2 + tolerance &&
                   ymin2 <= ymax1 + tolerance && ymin1 <= ymax2 + tolerance
               ? 1
               : 0;
}
