#pragma once

/// A transform of the plane for row vectors:
///
///                     | m11 m12 0 |
///     | x' y' 1 |  =  | m21 m22 0 |  from the left by  | x y 1 |
///                     | tX  tY  1 |
struct NSAffineTransform {
    double m11 = 1;
    double m12 = 0;
    double m21 = 0;
    double m22 = 1;
    double tX = 0;
    double tY = 0;
};
