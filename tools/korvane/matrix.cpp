#include "Input.h"
#include "Json.h"
#include "MatrixText.h"
#include "Numbers.h"
#include "ToolError.h"
#include "commands.h"

#include <korvane/numerics/KVMatrix44Double.h>

#include <cmath>
#include <memory>
#include <numbers>
#include <span>

namespace {

/// Sixteen numbers, row by row: each an argument, or all of them in the one file that is named.
class MatrixArgument {
public:
    void addTo(CLI::App& command, std::string const& description)
    {
        command.add_option("MATRIX", words_, description);
    }
    bool isGiven() const { return !words_.empty(); }

    Matrix read() const
    {
        if (words_.size() == 1)
            return readMatrix(words_[0], readFile(words_[0]));
        return matrixOf(words_);
    }

private:
    std::vector<std::string> words_;
};

Json rowsOf(Matrix const& matrix)
{
    Json rows = Json::array();
    for (int row = 0; row < 4; ++row)
        rows.push_back({matrix(row, 0), matrix(row, 1), matrix(row, 2), matrix(row, 3)});
    return rows;
}

/// Prints the matrix in a form that is read again.
void printMatrix(Matrix matrix, bool json)
{
    for (double& value : std::span(matrix.data(), 16)) {
        if (!std::isfinite(value))
            throw ToolError(ExitCode::Failed, "the result is out of range");
        value += 0.0; // -0 becomes 0
    }
    if (json) {
        printJson({{"matrix", rowsOf(matrix)}});
        return;
    }
    std::string text;
    for (int i = 0; i < 16; ++i)
        text += shortest(matrix.data()[i]) + (i % 4 == 3 ? "\n" : " ");
    printOutput(text);
}

Json axes(KVVector3<double> const& v)
{
    return {{"x", v.x}, {"y", v.y}, {"z", v.z}};
}

void decompose(Matrix const& matrix, bool json)
{
    KVMatrix44Parameters<double> p;
    p.rotOrder = rotationOrder;
    if (!matrix.getTransformation(p))
        throw ToolError(ExitCode::Failed, "a singular matrix cannot be taken apart");
    if (!json) {
        printOutput(KVMatrix44Double(matrix).extendedDescription().toUTF8() + "\n");
        return;
    }
    printJson({{"translation", axes(p.translation)},
               {"scale", axes(p.scale)},
               {"rotationRadians", axes(p.rotation)},
               {"shear", {{"x", p.shear.x}, {"y", p.shear.y}}},
               {"matrix", rowsOf(matrix)}});
}

void invert(Matrix const& matrix, bool planar, bool json)
{
    Matrix inverse;
    if (!(planar ? inverse.planarInverseZ(matrix) : inverse.invert(matrix)))
        throw ToolError(ExitCode::Failed, "a singular matrix has no inverse");
    printMatrix(inverse, json);
}

void addDecompose(CLI::App& family)
{
    struct Options {
        MatrixArgument matrix;
        bool json = false;
    };
    auto const options = std::make_shared<Options>();
    auto& command = *family.add_subcommand(
        "decompose", "Tell translation, scale, rotation and shear of a transform");
    options->matrix.addTo(command, "The transform");
    command.get_option("MATRIX")->required();
    addJsonFlag(command, options->json);
    command.callback([options] { decompose(options->matrix.read(), options->json); });
}

void addInvert(CLI::App& family)
{
    struct Options {
        MatrixArgument matrix;
        bool planar = false;
        bool json = false;
    };
    auto const options = std::make_shared<Options>();
    auto& command = *family.add_subcommand("invert", "Print the inverse of a transform");
    options->matrix.addTo(command, "The transform");
    command.get_option("MATRIX")->required();
    command.add_flag("--planar", options->planar,
                     "Invert in the plane z = 0; the result flattens z");
    addJsonFlag(command, options->json);
    command.callback([options] { invert(options->matrix.read(), options->planar, options->json); });
}

void addCompose(CLI::App& family)
{
    struct Options {
        MatrixArgument matrix;
        std::vector<double> translation{0, 0, 0}, scale{1, 1, 1}, rotation{0, 0, 0}, shear{0, 0};
        bool json = false;
    };
    auto const options = std::make_shared<Options>();
    auto& command = *family.add_subcommand(
        "compose", "Print the transform that rotates, then shears and scales, then translates");
    options->matrix.addTo(command, "A transform that acts before it; none if left out");
    auto const add = [&command](char const* name, std::vector<double>& values,
                                char const* description) {
        command.add_option(name, values, description)
            ->expected(static_cast<int>(values.size()))
            ->allow_extra_args(false)
            ->check(CLI::Number);
    };
    add("--translate", options->translation, "Along x, y and z");
    add("--scale", options->scale, "Along x, y and z");
    add("--rotate", options->rotation, "Degrees about x, y and z, applied about z, x, y");
    add("--shear", options->shear, "How much of x and of y column z gains");
    addJsonFlag(command, options->json);
    command.callback([options] {
        auto const vector = [](std::vector<double> const& v) {
            return KVVector3<double>(v[0], v[1], v[2]);
        };
        KVMatrix44Parameters<double> p;
        p.rotOrder = rotationOrder;
        p.translation = vector(options->translation);
        p.scale = vector(options->scale);
        p.rotation = vector(options->rotation) * (std::numbers::pi / 180);
        p.shear = {options->shear[0], options->shear[1]};
        Matrix matrix;
        matrix.setTransformation(p);
        if (options->matrix.isGiven())
            matrix.rightMult(options->matrix.read());
        printMatrix(matrix, options->json);
    });
}

} // namespace

void addMatrixCommands(CLI::App& program)
{
    auto& family = *program.add_subcommand("matrix", "Take 4x4 transforms apart, invert them and "
                                                     "put them together");
    family.require_subcommand(1);
    family.footer(
        "MATRIX is sixteen numbers, row by row, each an argument, or one FILE of them.\n"
        "The transform acts on columns: numbers 4, 8 and 12 are the translation. Rotations\n"
        "are applied about z, then x, then y; compose takes degrees, decompose --json\n"
        "gives radians.");
    addDecompose(family);
    addInvert(family);
    addCompose(family);

    addExamples(family, {"korvane matrix decompose camera.txt",
                         "korvane matrix compose --rotate 0 30 0 --translate 3.2 1.65 -7.4 | "
                         "korvane matrix invert -"});
}
