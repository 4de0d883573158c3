#pragma once

#include <korvane/numerics/KVMatrix44Tmpl.h>

// What a transform does near one point, measured with the derivative of its perspective division
// there: J = `matrix.jacobianPost(matrix * point)`. Without perspective J is the upper left 3x3
// part and the point does not matter.
//
//     KVVector3<double> scale, translate;
//     double angle;
//     getScaleTranslateRotate(matrix, scale, translate, angle);     // at the origin
//
// The forms without `point` measure at the origin, those without `size` take (1, 1, 1). A point
// that the matrix sends to w = 0 gives infinities or NaN.

/// `scale[i]` is the length of (J(0,i) size.x, J(1,i) size.y, J(2,i) size.z); with `flip` it is
/// negated where J(i,i) is negative.
KV_EXPORT void getScale(KVMatrix44Tmpl<double> const& matrix, KVVector3<double> const& point,
                        KVVector3<double> const& size, KVVector3<double>& scale, bool flip = false);
KV_EXPORT void getScale(KVMatrix44Tmpl<double> const& matrix, KVVector3<double> const& point,
                        KVVector3<double>& scale);
KV_EXPORT void getScale(KVMatrix44Tmpl<double> const& matrix, KVVector3<double>& scale);

/// The scale without flip; `translate` is how far the point moves.
KV_EXPORT void getScaleTranslate(KVMatrix44Tmpl<double> const& matrix,
                                 KVVector3<double> const& point, KVVector3<double> const& size,
                                 KVVector3<double>& scale, KVVector3<double>& translate);
KV_EXPORT void getScaleTranslate(KVMatrix44Tmpl<double> const& matrix,
                                 KVVector3<double> const& point, KVVector3<double>& scale,
                                 KVVector3<double>& translate);
KV_EXPORT void getScaleTranslate(KVMatrix44Tmpl<double> const& matrix, KVVector3<double>& scale,
                                 KVVector3<double>& translate);

/// The same with flip.
KV_EXPORT void getScaleTranslateFlip(KVMatrix44Tmpl<double> const& matrix,
                                     KVVector3<double> const& point, KVVector3<double> const& size,
                                     KVVector3<double>& scale, KVVector3<double>& translate);
KV_EXPORT void getScaleTranslateFlip(KVMatrix44Tmpl<double> const& matrix,
                                     KVVector3<double> const& point, KVVector3<double>& scale,
                                     KVVector3<double>& translate);
KV_EXPORT void getScaleTranslateFlip(KVMatrix44Tmpl<double> const& matrix, KVVector3<double>& scale,
                                     KVVector3<double>& translate);

/// The scale without flip, the translation and the angle in the xy plane, in radians. It has the
/// opposite sense to that of `leftRotate`: atan2(J(0,1), J(0,0)) if row 0 is the longer of the
/// first two rows of J, in its first two components, else atan2(-J(1,0), J(1,1)).
KV_EXPORT void getScaleTranslateRotate(KVMatrix44Tmpl<double> const& matrix,
                                       KVVector3<double> const& point,
                                       KVVector3<double> const& size, KVVector3<double>& scale,
                                       KVVector3<double>& translate, double& angle);
KV_EXPORT void getScaleTranslateRotate(KVMatrix44Tmpl<double> const& matrix,
                                       KVVector3<double> const& point, KVVector3<double>& scale,
                                       KVVector3<double>& translate, double& angle);
KV_EXPORT void getScaleTranslateRotate(KVMatrix44Tmpl<double> const& matrix,
                                       KVVector3<double>& scale, KVVector3<double>& translate,
                                       double& angle);

/// The affine map that touches the transform at the point: it sends the point to the same place and
/// has J as its 3x3 part. `out` may be `matrix`.
KV_EXPORT void perspectiveToAffine(KVMatrix44Tmpl<double> const& matrix,
                                   KVVector3<double> const& point, KVMatrix44Tmpl<double>& out);
