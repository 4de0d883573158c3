#pragma once

/// Matrices as the vector units of graphics code keep them: four columns of four lanes. Element
/// (row, col) is lane `row` of `columns[col]`.
struct simd_float4 {
    float x, y, z, w;
};
struct simd_double4 {
    double x, y, z, w;
};
struct simd_float4x4 {
    simd_float4 columns[4];
};
struct simd_double4x4 {
    simd_double4 columns[4];
};
