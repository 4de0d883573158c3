#include <korvane/compositing/KVBlend.h>
#include <korvane/compositing/KVFxBlendOptions.h>
#include <korvane/compositing/KVFxLightWrapOptions.h>
#include <korvane/foundation/KVException.h>

#include <gtest/gtest.h>
#include <support/Allocations.h>

#include <algorithm>
#include <limits>
#include <sstream>
#include <string>
#include <tuple>

namespace {

template <class T>
std::string printed(T value)
{
    std::ostringstream stream;
    stream << value;
    return stream.str();
}

/// Whether a list of names, with blanks around each, holds a mode's name.
bool contains(std::string const& list, KVBlendMode mode)
{
    return list.find(" " + printed(mode).substr(9) + " ") != std::string::npos;
}

std::string const notImplemented =
    " AVERAGE CLEAR COLOR DISSOLVE GRAY HUE INVERT LUMINOSITY MASK NEGATION OVER SATURATION TEST ";
std::string const noModes = " SEPARATOR0 SEPARATOR1 SEPARATOR2 SEPARATOR3 SEPARATOR4 SEPARATOR5 "
                            "SEPARATOR6 SEPARATOR SUPPORTED_LIST_END ";

/// "yes", "no" or what is thrown.
std::string answerOf(bool (*property)(KVBlendMode), KVBlendMode mode)
{
    try {
        return property(mode) ? "yes" : "no";
    } catch (KVUnsupportedOperationException const& exception) {
        EXPECT_EQ(exception.message().toUTF8(), "not implemented yet");
        return "unsupported";
    } catch (KVIllegalArgumentException const&) {
        return "illegal";
    }
}

TEST(KVBlend, PropertiesOfEveryMode)
{
    struct Row {
        char const* name;
        bool (*property)(KVBlendMode);
        std::string yes;
        char const* whenNotImplemented;
        char const* whenNoMode;
    } const rows[] = {
        {"isAbelian", [](KVBlendMode mode) { return KVBlend::isAbelian(mode); },
         " DARKEN MULTIPLY ADD LIGHTEN SCREEN DIFFERENCE EXCLUSION ", "no", "no"},
        {"isAssociative", KVBlend::isAssociative,
         " NORMAL DARKEN MULTIPLY ADD LIGHTEN SCREEN EXCLUSION ALPHA_ADD LIGHT_WRAP NONE ",
         "unsupported", "illegal"},
        {"isNormalOverNothing", KVBlend::isNormalOverNothing,
         " NORMAL SUBTRACT DARKEN MULTIPLY COLOR_BURN LINEAR_BURN ADD LIGHTEN SCREEN COLOR_DODGE "
         "LINEAR_DODGE OVERLAY SOFT_LIGHT HARD_LIGHT VIVID_LIGHT LINEAR_LIGHT PIN_LIGHT HARD_MIX "
         "DIFFERENCE EXCLUSION BEHIND ALPHA_ADD LUMINESCENT_PREMUL COMBINE LIGHT_WRAP NONE ",
         "unsupported", "illegal"},
        {"treatsBlackLikeNormal", KVBlend::treatsBlackLikeNormal,
         " NORMAL SUBTRACT DARKEN MULTIPLY COLOR_BURN LINEAR_BURN ADD OVERLAY HARD_LIGHT ", "no",
         "illegal"},
    };
    for (auto const& row : rows) {
        for (int value = 0; value < 52; ++value) {
            auto const mode = static_cast<KVBlendMode>(value);
            std::string const expected = contains(row.yes, mode)          ? "yes"
                                         : contains(notImplemented, mode) ? row.whenNotImplemented
                                         : contains(noModes, mode)        ? row.whenNoMode
                                                                          : "no";
            EXPECT_EQ(answerOf(row.property, mode), expected) << row.name << " " << mode;
        }
        for (int const value : {-1, 52, 1000, std::numeric_limits<int>::min()})
            EXPECT_EQ(answerOf(row.property, static_cast<KVBlendMode>(value)), row.whenNoMode)
                << row.name << " " << value;
    }
    // Meant so: the two questions have one answer.
    for (int value = -1; value < 53; ++value) {
        auto const mode = static_cast<KVBlendMode>(value);
        EXPECT_EQ(answerOf(KVBlend::isNothingOverNothing, mode),
                  answerOf(KVBlend::isNormalOverNothing, mode));
    }
}

TEST(KVBlend, MenusAndPlacesInThem)
{
    std::string menu;
    for (KVBlendMode const mode : KVBlend::getElementBlendModes())
        menu += mode == KV_BLEND_SEPARATOR ? "| " : printed(mode).substr(9) + " ";
    EXPECT_EQ(menu, "NORMAL | SUBTRACT DARKEN MULTIPLY COLOR_BURN LINEAR_BURN | ADD LIGHTEN SCREEN "
                    "COLOR_DODGE LINEAR_DODGE | OVERLAY SOFT_LIGHT HARD_LIGHT VIVID_LIGHT "
                    "LINEAR_LIGHT PIN_LIGHT HARD_MIX | DIFFERENCE EXCLUSION | STENCIL_ALPHA "
                    "STENCIL_LUMA SILHOUETTE_ALPHA SILHOUETTE_LUMA BEHIND | ALPHA_ADD LIGHT_WRAP ");
    unsigned int elements = 0;
    unsigned int layers = 0;
    KVBlendMode const* const element = KVBlend::getElementBlendModes(elements);
    KVBlendMode const* const layer = KVBlend::getLayerBlendModes(layers);
    EXPECT_EQ(elements, 33u);
    ASSERT_EQ(layers, 35u);
    EXPECT_EQ(layer[0], KV_BLEND_COMBINE);
    EXPECT_EQ(layer[1], KV_BLEND_SEPARATOR);
    EXPECT_TRUE(std::equal(element, element + elements, layer + 2));

    for (bool const inLayer : {false, true}) {
        auto const modes =
            inLayer ? KVBlend::getLayerBlendModes() : KVBlend::getElementBlendModes();
        for (unsigned int i = 0; i < modes.size(); ++i) {
            EXPECT_EQ(KVBlend::indexToBlendMode(i, inLayer), modes[i]);
            if (modes[i] != KV_BLEND_SEPARATOR) {
                EXPECT_EQ(KVBlend::blendModeToIndex(modes[i], inLayer), i);
            }
        }
        EXPECT_EQ(KVBlend::blendModeToIndex(KV_BLEND_SEPARATOR, inLayer), 1u); // the first of many
        for (int const absent : {1, 7, 36, 49, 51, 52, -1, std::numeric_limits<int>::max()})
            EXPECT_EQ(KVBlend::blendModeToIndex(static_cast<KVBlendMode>(absent), inLayer), 0u);
        for (unsigned int const outside : {inLayer ? layers : elements, 0xFFFFFFFFu})
            EXPECT_EQ(KVBlend::indexToBlendMode(outside, inLayer), KV_BLEND_NORMAL);
    }
    EXPECT_EQ(KVBlend::elementBlendModeToIndex(KV_BLEND_COMBINE), 0u);
}

TEST(KVBlend, NamesAreThePlacesOfTheNumbers)
{
    struct Row {
        int value;
        bool combine;
        char const* name;
    } const rows[] = {{KV_BLEND_NORMAL, false, "Normal"},
                      {KV_BLEND_NORMAL, true, "Combine"},
                      {KV_BLEND_SEPARATOR0, false, "-"},
                      {KV_BLEND_BEHIND, false, "Behind"},
                      {KV_BLEND_ADD, false, "Add"},
                      {KV_BLEND_ALPHA_ADD, false, "Alpha Add"},
                      {-1, true, ""},
                      {-1, false, "-"},
                      {-3, false, ""},
                      {0x7FFFFFFF, false, ""}};
    for (auto const& row : rows)
        EXPECT_EQ(KVBlend::modeName(static_cast<KVBlendMode>(row.value), row.combine).toUTF8(),
                  row.name)
            << row.value;
    // Meant so: the numbers and the menu part here.
    EXPECT_EQ(KVBlend::modeName(KV_BLEND_LUMINESCENT_PREMUL, false).toUTF8(), "Light Wrap");
    EXPECT_EQ(KVBlend::modeName(KV_BLEND_SEPARATOR6, false).toUTF8(), "");
    EXPECT_EQ(KVBlend::modeName(KV_BLEND_COMBINE, true).toUTF8(), "Light Wrap");
    EXPECT_EQ(KVBlend::modeCount(true), 35u);
    EXPECT_EQ(KVBlend::modeCount(false), 33u);
    EXPECT_EQ(KVBlend::maskModeCount(), 4u);
    EXPECT_EQ(KVBlend::maskModeName(KV_MASK_BLEND_INTERSECT).toUTF8(), "Intersect");
    EXPECT_EQ(KVBlend::maskModeName(KV_BLEND_NORMAL).toUTF8(), "Add");
    EXPECT_EQ(KVBlend::maskModeName(KV_MASK_BLEND_SUPPORTED_LIST_END).toUTF8(), "");

    std::string const plain = KVBlend::modeMenuString(false);
    EXPECT_EQ("Combine|-|" + plain, KVBlend::modeMenuString(true).toUTF8());
    EXPECT_TRUE(plain.starts_with(KVBlend::reflectionModeMenuString().toUTF8()));
    EXPECT_EQ(KVBlend::lightWrapModeMenuString().toUTF8(),
              "Normal|Lighten|Screen|Overlay|Hard Light");
}

TEST(KVBlend, ConstantsPrintTheirNames)
{
    EXPECT_EQ(printed(KV_BLEND_NORMAL), "KV_BLEND_NORMAL");
    EXPECT_EQ(printed(KV_BLEND_TEST), "KV_BLEND_TEST");
    EXPECT_EQ(printed(static_cast<KVBlendMode>(52)), "52");
    EXPECT_EQ(printed(KV_MASK_BLEND_SUPPORTED_LIST_END), "KV_MASK_BLEND_SUPPORTED_LIST_END");
    EXPECT_EQ(printed(static_cast<KVMaskBlendMode>(5)), "5");
    EXPECT_EQ(printed(KV_LRBLEND_HARD_LIGHT), "KV_LRBLEND_HARD_LIGHT");
    EXPECT_EQ(printed(static_cast<KVLightWrapBlendMode>(-1)), "-1");
}

TEST(KVBlend, LightWrapModesAreBlendModes)
{
    std::string modes;
    for (int value = -1; value < 6; ++value)
        modes +=
            printed(KVBlend::lrBlendToKVBlend(static_cast<KVLightWrapBlendMode>(value))).substr(9) +
            " ";
    EXPECT_EQ(modes, "NORMAL NORMAL LIGHTEN SCREEN OVERLAY HARD_LIGHT NORMAL ");
}

TEST(KVBlend, AllocatesNothingAfterTheFirstUse)
{
    auto const useAll = [] {
        for (int value = -1; value < 36; ++value) {
            auto const mode = static_cast<KVBlendMode>(value);
            KVBlend::modeName(mode, true);
            KVBlend::maskModeName(mode);
            KVBlend::blendModeToIndex(mode, value % 2 != 0);
            KVBlend::isAbelian(mode);
            KVBlend::modeMenuString(true);
        }
    };
    useAll();
    long const before = allocations::count();
    useAll();
    EXPECT_EQ(allocations::count(), before);
}

TEST(KVFxOptions, AreValues)
{
    KVFxLightWrapOptions options;
    EXPECT_EQ(options.getLRBlendMode(), KV_LRBLEND_NORMAL);
    options.setBlendMode(KV_BLEND_ADD);
    options.setAmount(1);
    options.setIntensity(2);
    options.setOpacity(3);
    options.setLRBlendMode(KV_LRBLEND_SCREEN);
    KVFxLightWrapOptions const copy(options);
    EXPECT_EQ(copy, options);
    EXPECT_EQ(std::tuple(copy.getAmount(), copy.getIntensity(), copy.getOpacity()),
              std::tuple(1.0f, 2.0f, 3.0f));
    EXPECT_EQ(copy.getLRBlendMode(), KV_LRBLEND_SCREEN);
    options.setAmount(9);
    EXPECT_NE(copy, options);
    EXPECT_EQ(KVFxBlendOptions(copy).getBlendMode(), KV_BLEND_ADD);
}

} // namespace
