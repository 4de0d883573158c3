#include <korvane/numerics/KVMatrix33Tmpl.h>

#include <utility>

template <class T>
KVMatrix33Tmpl<T> KVMatrix33Tmpl<T>::operator*(KVMatrix33Tmpl const& b) const noexcept
{
    KVMatrix33Tmpl product;
    for (int row = 0; row < 3; ++row)
        for (int col = 0; col < 3; ++col)
            product(row, col) = (*this)(row, 0) * b(0, col) + (*this)(row, 1) * b(1, col) +
                                (*this)(row, 2) * b(2, col);
    return product;
}

template <class T>
void KVMatrix33Tmpl<T>::transpose() noexcept
{
    std::swap(values_[1], values_[3]);
    std::swap(values_[2], values_[6]);
    std::swap(values_[5], values_[7]);
}

template <class T>
T KVMatrix33Tmpl<T>::determinant() const noexcept
{
    auto const& m = values_;
    return m[0] * (m[4] * m[8] - m[5] * m[7]) + m[1] * (m[5] * m[6] - m[3] * m[8]) +
           m[2] * (m[3] * m[7] - m[4] * m[6]);
}

template <class T>
bool KVMatrix33Tmpl<T>::invert(KVMatrix33Tmpl const& source, double tolerance) noexcept
{
    T const determinant = source.determinant();
    if (determinant == 0 || std::abs(determinant) < tolerance)
        return false;
    auto const& m = source.values_;
    std::array<T, 9> const adjugate{
        m[4] * m[8] - m[5] * m[7], m[2] * m[7] - m[1] * m[8], m[1] * m[5] - m[2] * m[4],
        m[5] * m[6] - m[3] * m[8], m[0] * m[8] - m[2] * m[6], m[2] * m[3] - m[0] * m[5],
        m[3] * m[7] - m[4] * m[6], m[1] * m[6] - m[0] * m[7], m[0] * m[4] - m[1] * m[3]};
    for (std::size_t i = 0; i < 9; ++i)
        values_[i] = adjugate[i] / determinant;
    return true;
}

template class KVMatrix33Tmpl<float>;
template class KVMatrix33Tmpl<double>;
