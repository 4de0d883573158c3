// Shown by docs/numerics.md.
#include <korvane/numerics/KVMatrix44Tmpl.h>

#include <cmath>
#include <iostream>

using Matrix = KVMatrix44Tmpl<double>;

int main()
{
    Matrix camera;                         // the identity
    camera.leftRotate(0.5, Matrix::yAxis); // what is put on the left acts last
    camera.leftTranslate(3.2, 1.65, -7.4);

    Matrix view;
    if (!view.invert(camera)) // false: singular, and `view` is as it was
        return 1;
    KVVector3<double> seen;
    view.transform(KVVector3<double>(3.2, 1.65, -7.4), seen); // divides by w, and does not test it

    KVMatrix44Parameters<double> parts;
    parts.rotOrder = 4; // about z, then x, then y
    if (!camera.getTransformation(parts))
        return 1;
    std::cout << parts.rotation.y << " about y\n"; // 0.5
    return std::abs(seen.x) < 1e-12 && std::abs(parts.rotation.y - 0.5) < 1e-12 ? 0 : 1;
}
