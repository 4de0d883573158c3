#pragma once

/// A transform of the plane for row vectors, at first the one that changes nothing:
///
///                               | m11 m12 0 |
///     | x' y' 1 |  =  | x y 1 | | m21 m22 0 |
///                               | tX  tY  1 |
///
/// that is x' = m11 x + m21 y + tX and y' = m12 x + m22 y + tY.
struct NSAffineTransform {
    double m11 = 1;
    double m12 = 0;
    double m21 = 0;
    double m22 = 1;
    double tX = 0;
    double tY = 0;
};
