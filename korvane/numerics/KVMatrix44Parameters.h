#pragma once

#include <korvane/numerics/KVVector3.h>

#include <cstdint>

/// What a 4x4 transform is made of: see KVMatrix44Tmpl::getTransformation. A default-made record is
/// that of the identity.
///
/// `rotOrder` tells in which order the three rotations are applied to a point:
///
///     rotOrder   0    1    2    3    4    5
///     applied    xyz  xzy  yxz  yzx  zxy  zyx
///
/// so 4 is the rotation about z, then that about x, then that about y: Ry Rx Rz.
template <class T>
struct KVMatrix44Parameters {
    KVVector3<T> translation;
    KVVector3<T> scale{1, 1, 1};
    std::int32_t rotOrder = 0;
    /// Radians about the x, y and z axis.
    KVVector3<T> rotation;
    /// How much of x (`shear.x`) and of y (`shear.y`) is added to z, before z is scaled. The shear
    /// of y by x has no field.
    KVVector2<T> shear;
};
