// Products, inverses, transforms and decompositions beside Eigen and Imath. Imath's matrices act on
// rows: theirs are filled transposed, so that all take the same transform.

#include <korvane/numerics/KVMatrix44Tmpl.h>

#include <benchmark/benchmark.h>

#ifdef HAVE_EIGEN
#include <Eigen/Dense>
#endif
#ifdef HAVE_IMATH
#include <Imath/ImathMatrix.h>
#include <Imath/ImathMatrixAlgo.h>
#endif

#include <random>
#include <vector>

namespace {

constexpr int matrixCount = 64; // 24 KiB for two operands and a result: they stay in the L1 cache
constexpr int pointCount = 1'000'000;

using Ours = KVMatrix44Tmpl<double>;

double& element(Ours& m, int row, int col)
{
    return m(row, col);
}
#ifdef HAVE_EIGEN
using EigenMatrix = Eigen::Matrix4d;
double& element(EigenMatrix& m, int row, int col)
{
    return m(row, col);
}
#endif
#ifdef HAVE_IMATH
using ImathMatrix = Imath::M44d;
double& element(ImathMatrix& m, int row, int col)
{
    return m[col][row];
}
#endif

template <class Matrix>
std::vector<Matrix> randomMatrices(unsigned int seed, bool affine = false)
{
    std::mt19937 random(seed);
    std::uniform_real_distribution<double> number(-1, 1);
    std::vector<Matrix> matrices(matrixCount);
    for (Matrix& m : matrices)
        for (int row = 0; row < 4; ++row)
            for (int col = 0; col < 4; ++col)
                element(m, row, col) = affine && row == 3 ? col == 3 : number(random);
    return matrices;
}

template <class Matrix, class Multiply>
void product(benchmark::State& state, Multiply multiply)
{
    auto const a = randomMatrices<Matrix>(1);
    auto const b = randomMatrices<Matrix>(2);
    auto out = a;
    for (auto _ : state) {
        for (int i = 0; i < matrixCount; ++i)
            multiply(a[i], b[i], out[i]);
        benchmark::DoNotOptimize(out.data());
        benchmark::ClobberMemory();
    }
    state.SetItemsProcessed(state.iterations() * matrixCount);
}

template <class Matrix, class Invert>
void inverse(benchmark::State& state, Invert invert)
{
    product<Matrix>(state,
                    [invert](Matrix const& a, Matrix const&, Matrix& out) { invert(a, out); });
}

template <class Matrix, class Vector, class Transform>
void points(benchmark::State& state, Transform transform)
{
    Matrix const m = randomMatrices<Matrix>(1)[0];
    std::mt19937 random(3);
    std::uniform_real_distribution<double> number(-1, 1);
    std::vector<Vector> in(pointCount), out(pointCount);
    for (Vector& v : in)
        v = Vector(number(random), number(random), number(random));
    for (auto _ : state) {
        for (int i = 0; i < pointCount; ++i)
            transform(m, in[i], out[i]);
        benchmark::DoNotOptimize(out.data());
        benchmark::ClobberMemory();
    }
    state.SetItemsProcessed(state.iterations() * pointCount);
}

template <class Matrix, class Decompose>
void decomposition(benchmark::State& state, Decompose decompose)
{
    auto const matrices = randomMatrices<Matrix>(4, true);
    for (auto _ : state)
        for (Matrix const& m : matrices)
            decompose(m);
    state.SetItemsProcessed(state.iterations() * matrixCount);
}

void productOurs(benchmark::State& state)
{
    product<Ours>(state, [](Ours const& a, Ours const& b, Ours& out) { out = a * b; });
}
BENCHMARK(productOurs)->Name("Product/ours");

void inverseOurs(benchmark::State& state)
{
    inverse<Ours>(state, [](Ours const& m, Ours& out) { out.invert(m); });
}
BENCHMARK(inverseOurs)->Name("Inverse/ours");

void pointsOurs(benchmark::State& state)
{
    using Vector = KVVector3<double>;
    points<Ours, Vector>(
        state, [](Ours const& m, Vector const& in, Vector& out) { m.transform(in, out); });
}
BENCHMARK(pointsOurs)->Name("Points/ours")->Unit(benchmark::kMillisecond);

void decompositionOurs(benchmark::State& state)
{
    decomposition<Ours>(state, [](Ours const& m) {
        KVMatrix44Parameters<double> parameters;
        bool found = m.getTransformation(parameters);
        benchmark::DoNotOptimize(found);
        benchmark::DoNotOptimize(parameters);
    });
}
BENCHMARK(decompositionOurs)->Name("Decomposition/ours");

#ifdef HAVE_EIGEN
void productEigen(benchmark::State& state)
{
    product<EigenMatrix>(state, [](EigenMatrix const& a, EigenMatrix const& b, EigenMatrix& out) {
        out.noalias() = a * b;
    });
}
BENCHMARK(productEigen)->Name("Product/peer:Eigen");

void inverseEigen(benchmark::State& state)
{
    inverse<EigenMatrix>(state, [](EigenMatrix const& m, EigenMatrix& out) { out = m.inverse(); });
}
BENCHMARK(inverseEigen)->Name("Inverse/peer:Eigen");

void pointsEigen(benchmark::State& state)
{
    using Vector = Eigen::Vector3d;
    points<EigenMatrix, Vector>(state, [](EigenMatrix const& m, Vector const& in, Vector& out) {
        out = (m * in.homogeneous()).eval().hnormalized();
    });
}
BENCHMARK(pointsEigen)->Name("Points/peer:Eigen")->Unit(benchmark::kMillisecond);
#endif

#ifdef HAVE_IMATH
void productImath(benchmark::State& state)
{
    product<ImathMatrix>(
        state, [](ImathMatrix const& a, ImathMatrix const& b, ImathMatrix& out) { out = a * b; });
}
BENCHMARK(productImath)->Name("Product/peer:Imath");

void inverseImath(benchmark::State& state)
{
    inverse<ImathMatrix>(state, [](ImathMatrix const& m, ImathMatrix& out) { out = m.inverse(); });
}
BENCHMARK(inverseImath)->Name("Inverse/peer:Imath");

void pointsImath(benchmark::State& state)
{
    using Vector = Imath::V3d;
    points<ImathMatrix, Vector>(state, [](ImathMatrix const& m, Vector const& in, Vector& out) {
        m.multVecMatrix(in, out);
    });
}
BENCHMARK(pointsImath)->Name("Points/peer:Imath")->Unit(benchmark::kMillisecond);

void decompositionImath(benchmark::State& state)
{
    decomposition<ImathMatrix>(state, [](ImathMatrix const& m) {
        Imath::V3d scale, shear, rotation, translation;
        bool found = Imath::extractSHRT(m, scale, shear, rotation, translation, false);
        benchmark::DoNotOptimize(found);
        benchmark::DoNotOptimize(scale);
        benchmark::DoNotOptimize(shear);
        benchmark::DoNotOptimize(rotation);
        benchmark::DoNotOptimize(translation);
    });
}
BENCHMARK(decompositionImath)->Name("Decomposition/peer:Imath");
#endif

} // namespace
