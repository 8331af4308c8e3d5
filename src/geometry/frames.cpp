// Frame transforms between an outer system and a frame's own (origin,
// rotation matrix, scale). The way back multiplies by the transpose: the
// matrix is taken as orthonormal and never inverted.
#include <cmath>

#include "core/status.h"
#include "geometry/kernel.h"

using tessarine::kErrGeneral;
using tessarine::kOk;

namespace {

// A scale this small cannot be divided by.
bool ScaleTooSmall(double scale) { return std::fabs(scale) <= 0.0001; }

}  // namespace

extern "C" {

TESSARINE_API int32_t VC_xformMatrix(double angle, double *matrix) {
    matrix[0] = std::cos(angle);
    matrix[3] = matrix[0];
    matrix[1] = std::sin(angle);
    matrix[2] = -std::sin(angle);
    return kOk;
}

TESSARINE_API int32_t BZ_2Doldtnw(double originX, double originY, const double *matrix,
                                  double scale, double x, double y, BZ_Point *out) {
    const double dx = x - originX;
    const double dy = y - originY;
    out->x = (dx * matrix[0] + dy * matrix[1]) * scale;
    out->y = (dx * matrix[2] + dy * matrix[3]) * scale;
    return kOk;
}

TESSARINE_API int32_t BZ_2Dnwtold(double originX, double originY, const double *matrix,
                                  double scale, double x, double y, BZ_Point *out) {
    if (ScaleTooSmall(scale)) return kErrGeneral;
    const double inverse = 1.0 / scale;
    out->x = (x * matrix[0] + y * matrix[2]) * inverse + originX;
    out->y = (x * matrix[1] + y * matrix[3]) * inverse + originY;
    return kOk;
}

TESSARINE_API int32_t BZ_3Doldtnw(double originX, double originY, double originZ,
                                  const double *matrix, double scale, double x, double y, double z,
                                  double *out) {
    const double d[3] = {x - originX, y - originY, z - originZ};
    double r[3];
    for (int i = 0; i < 3; ++i) {
        const double *row = matrix + 3 * i;
        r[i] = (d[0] * row[0] + d[1] * row[1] + d[2] * row[2]) * scale;
    }
    out[0] = r[0];
    out[1] = r[1];
    out[2] = r[2];
    return kOk;
}

TESSARINE_API int32_t BZ_3Dnwtold(double originX, double originY, double originZ,
                                  const double *matrix, double scale, double x, double y, double z,
                                  double *out) {
    if (ScaleTooSmall(scale)) return kErrGeneral;
    const double inverse = 1.0 / scale;
    const double origin[3] = {originX, originY, originZ};
    double r[3];
    for (int j = 0; j < 3; ++j)
        r[j] = (x * matrix[j] + y * matrix[3 + j] + z * matrix[6 + j]) * inverse + origin[j];
    out[0] = r[0];
    out[1] = r[1];
    out[2] = r[2];
    return kOk;
}

}  // extern "C"
