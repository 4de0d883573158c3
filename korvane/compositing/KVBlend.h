#pragma once

#include <korvane/foundation/KVString.h>

#include <cstdint>
#include <iosfwd>
#include <span>

/// How a layer is laid over what is below it. The numbers are part of documents and do not change;
/// the numbered separators are gaps in them, menus use KV_BLEND_SEPARATOR.
enum KVBlendMode : std::int32_t {
    KV_BLEND_NORMAL = 0,
    KV_BLEND_SEPARATOR0 = 1,
    KV_BLEND_SUBTRACT = 2,
    KV_BLEND_DARKEN = 3,
    KV_BLEND_MULTIPLY = 4,
    KV_BLEND_COLOR_BURN = 5,
    KV_BLEND_LINEAR_BURN = 6,
    KV_BLEND_SEPARATOR1 = 7,
    KV_BLEND_ADD = 8,
    KV_BLEND_LIGHTEN = 9,
    KV_BLEND_SCREEN = 10,
    KV_BLEND_COLOR_DODGE = 11,
    KV_BLEND_LINEAR_DODGE = 12,
    KV_BLEND_SEPARATOR2 = 13,
    KV_BLEND_OVERLAY = 14,
    KV_BLEND_SOFT_LIGHT = 15,
    KV_BLEND_HARD_LIGHT = 16,
    KV_BLEND_VIVID_LIGHT = 17,
    KV_BLEND_LINEAR_LIGHT = 18,
    KV_BLEND_PIN_LIGHT = 19,
    KV_BLEND_HARD_MIX = 20,
    KV_BLEND_SEPARATOR3 = 21,
    KV_BLEND_DIFFERENCE = 22,
    KV_BLEND_EXCLUSION = 23,
    KV_BLEND_SEPARATOR4 = 24,
    KV_BLEND_STENCIL_ALPHA = 25,
    KV_BLEND_STENCIL_LUMA = 26,
    KV_BLEND_SILHOUETTE_ALPHA = 27,
    KV_BLEND_SILHOUETTE_LUMA = 28,
    KV_BLEND_BEHIND = 29,
    KV_BLEND_SEPARATOR5 = 30,
    KV_BLEND_ALPHA_ADD = 31,
    KV_BLEND_LUMINESCENT_PREMUL = 32,
    KV_BLEND_SEPARATOR6 = 33,
    KV_BLEND_COMBINE = 34,
    KV_BLEND_LIGHT_WRAP = 35,
    KV_BLEND_SUPPORTED_LIST_END = 36,
    KV_BLEND_SEPARATOR = 37,
    KV_BLEND_AVERAGE = 38,
    KV_BLEND_CLEAR = 39,
    KV_BLEND_COLOR = 40,
    KV_BLEND_DISSOLVE = 41,
    KV_BLEND_GRAY = 42,
    KV_BLEND_HUE = 43,
    KV_BLEND_INVERT = 44,
    KV_BLEND_LUMINOSITY = 45,
    KV_BLEND_MASK = 46,
    KV_BLEND_NEGATION = 47,
    KV_BLEND_NONE = 48,
    KV_BLEND_OVER = 49,
    KV_BLEND_SATURATION = 50,
    KV_BLEND_TEST = 51,
};

/// How a mask joins the masks before it.
enum KVMaskBlendMode : std::int32_t {
    KV_MASK_BLEND_ADD = 0,
    KV_MASK_BLEND_SUBTRACT = 1,
    KV_MASK_BLEND_REPLACE = 2,
    KV_MASK_BLEND_INTERSECT = 3,
    KV_MASK_BLEND_SUPPORTED_LIST_END = 4,
};

/// How wrapped light is laid over a layer's edges.
enum KVLightWrapBlendMode : std::int32_t {
    KV_LRBLEND_NORMAL = 0,
    KV_LRBLEND_LIGHTEN = 1,
    KV_LRBLEND_SCREEN = 2,
    KV_LRBLEND_OVERLAY = 3,
    KV_LRBLEND_HARD_LIGHT = 4,
};

/// Print the constants' names ("KV_BLEND_ADD"), and a value without a name as its number.
KV_EXPORT std::ostream& operator<<(std::ostream&, KVBlendMode);
KV_EXPORT std::ostream& operator<<(std::ostream&, KVMaskBlendMode);
KV_EXPORT std::ostream& operator<<(std::ostream&, KVLightWrapBlendMode);

/// The menus that offer blend modes, and what a compositor may rely on before it reorders or skips
/// work.
///
///     for (KVBlendMode const mode : KVBlend::getElementBlendModes())
///         if (mode == KV_BLEND_SEPARATOR)
///             menu.addSeparator();
///         else
///             menu.add(mode);
///     KVBlendMode const chosen = KVBlend::indexToElementBlendMode(menu.selected());
///
/// The element menu has 33 entries; the layer menu is the same with KV_BLEND_COMBINE and a
/// separator in front. The arithmetic of the modes on pixels belongs to the host's renderer.
///
/// All functions take constant time, allocate nothing after their first use and may be called from
/// any thread.
class KV_EXPORT KVBlend {
public:
    // --- Menu texts ---

    /// The names of a menu's entries with "|" between them and "-" for a separator. They are looked
    /// up in the table `com.brovo.korvane.framework` under "Blend Modes Combine" (the layer menu)
    /// or "Blend Modes" (the element menu), "Light Wrap Blend Modes", "Blend Modes Reflection" and
    /// "Mask Blend Modes"; without such a table they are English.
    static KVString modeMenuString(bool combine);
    static KVString lightWrapModeMenuString();
    static KVString reflectionModeMenuString();
    static KVString maskModeMenuString();

    /// The number of entries of the layer menu (`combine`), or two less.
    static unsigned int modeCount(bool combine);
    /// The entry of the layer menu at the mode's number (`combine`), or two places behind it, which
    /// is the element menu's. This gives a mode its own name from KV_BLEND_NORMAL to
    /// KV_BLEND_ALPHA_ADD, without `combine`; KV_BLEND_LUMINESCENT_PREMUL gets the last entry,
    /// "Light Wrap", and what lies beyond the menu an empty string.
    static KVString modeName(KVBlendMode mode, bool combine);
    static unsigned int maskModeCount();
    /// The entry of the mask menu at the mode's number; empty beyond it.
    static KVString maskModeName(KVBlendMode mode);
    static KVString maskModeName(KVMaskBlendMode mode);

    // --- Menu places ---

    /// The mode at a place of a menu; KV_BLEND_NORMAL beyond its end.
    static KVBlendMode indexToElementBlendMode(unsigned int index) noexcept;
    static KVBlendMode indexToLayerBlendMode(unsigned int index) noexcept;
    static KVBlendMode indexToBlendMode(unsigned int index, bool layer) noexcept;

    /// The first place of a mode in a menu; 0, the first entry, for one that is not in it, as the
    /// numbered separators are not.
    static unsigned int elementBlendModeToIndex(KVBlendMode mode) noexcept;
    static unsigned int layerBlendModeToIndex(KVBlendMode mode) noexcept;
    static unsigned int blendModeToIndex(KVBlendMode mode, bool layer) noexcept;

    /// The menus, in order. They live as long as the process.
    static KVBlendMode const* getElementBlendModes(unsigned int& count) noexcept;
    static KVBlendMode const* getLayerBlendModes(unsigned int& count) noexcept;
    static std::span<KVBlendMode const> getElementBlendModes() noexcept;
    static std::span<KVBlendMode const> getLayerBlendModes() noexcept;

    // --- Properties ---
    //
    // All but the first throw KVIllegalArgumentException for separators,
    // KV_BLEND_SUPPORTED_LIST_END and numbers that are no mode. KV_BLEND_AVERAGE to KV_BLEND_TEST,
    // KV_BLEND_NONE excepted, are the modes without an answer: those that say so throw
    // KVUnsupportedOperationException for them.

    /// Whether the two layers may be exchanged; false for what is no mode.
    static bool isAbelian(KVBlendMode mode) noexcept;
    /// Whether layers may be grouped in any way. Throws for the modes without an answer.
    static bool isAssociative(KVBlendMode mode);
    /// Whether over nothing the mode leaves the layer as KV_BLEND_NORMAL does. Throws for the modes
    /// without an answer.
    static bool isNormalOverNothing(KVBlendMode mode);
    /// Whether nothing over nothing is nothing; the same answers as `isNormalOverNothing`, failures
    /// too.
    static bool isNothingOverNothing(KVBlendMode mode);
    /// Whether a black layer gives what KV_BLEND_NORMAL gives; false for the modes without an
    /// answer.
    static bool treatsBlackLikeNormal(KVBlendMode mode);

    /// The blend mode of the same name; KV_BLEND_NORMAL for any other value.
    static KVBlendMode lrBlendToKVBlend(KVLightWrapBlendMode mode) noexcept;
};
