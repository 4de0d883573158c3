#include <korvane/compositing/KVBlend.h>

#include <korvane/foundation/KVException.h>

#include <algorithm>
#include <array>
#include <ostream>
#include <string_view>
#include <vector>

namespace {

// --- What is known of each mode ---

enum Answer : unsigned char { no, yes, unsupported, illegal };

struct ModeFacts {
    KVBlendMode mode;
    char const* name;
    bool abelian;
    Answer associative;
    Answer normalOverNothing;
    Answer blackLikeNormal;
};

#define MODE(name) KV_BLEND_##name, "KV_BLEND_" #name
constexpr ModeFacts facts[] = {
    // mode, abelian, associative, normal over nothing, black like normal
    {MODE(NORMAL), false, yes, yes, yes},
    {MODE(SEPARATOR0), false, illegal, illegal, illegal},
    {MODE(SUBTRACT), false, no, yes, yes},
    {MODE(DARKEN), true, yes, yes, yes},
    {MODE(MULTIPLY), true, yes, yes, yes},
    {MODE(COLOR_BURN), false, no, yes, yes},
    {MODE(LINEAR_BURN), false, no, yes, yes},
    {MODE(SEPARATOR1), false, illegal, illegal, illegal},
    {MODE(ADD), true, yes, yes, yes},
    {MODE(LIGHTEN), true, yes, yes, no},
    {MODE(SCREEN), true, yes, yes, no},
    {MODE(COLOR_DODGE), false, no, yes, no},
    {MODE(LINEAR_DODGE), false, no, yes, no},
    {MODE(SEPARATOR2), false, illegal, illegal, illegal},
    {MODE(OVERLAY), false, no, yes, yes},
    {MODE(SOFT_LIGHT), false, no, yes, no},
    {MODE(HARD_LIGHT), false, no, yes, yes},
    {MODE(VIVID_LIGHT), false, no, yes, no},
    {MODE(LINEAR_LIGHT), false, no, yes, no},
    {MODE(PIN_LIGHT), false, no, yes, no},
    {MODE(HARD_MIX), false, no, yes, no},
    {MODE(SEPARATOR3), false, illegal, illegal, illegal},
    {MODE(DIFFERENCE), true, no, yes, no},
    {MODE(EXCLUSION), true, yes, yes, no},
    {MODE(SEPARATOR4), false, illegal, illegal, illegal},
    {MODE(STENCIL_ALPHA), false, no, no, no},
    {MODE(STENCIL_LUMA), false, no, no, no},
    {MODE(SILHOUETTE_ALPHA), false, no, no, no},
    {MODE(SILHOUETTE_LUMA), false, no, no, no},
    {MODE(BEHIND), false, no, yes, no},
    {MODE(SEPARATOR5), false, illegal, illegal, illegal},
    {MODE(ALPHA_ADD), false, yes, yes, no},
    {MODE(LUMINESCENT_PREMUL), false, no, yes, no},
    {MODE(SEPARATOR6), false, illegal, illegal, illegal},
    {MODE(COMBINE), false, no, yes, no},
    {MODE(LIGHT_WRAP), false, yes, yes, no},
    {MODE(SUPPORTED_LIST_END), false, illegal, illegal, illegal},
    {MODE(SEPARATOR), false, illegal, illegal, illegal},
    {MODE(AVERAGE), false, unsupported, unsupported, no},
    {MODE(CLEAR), false, unsupported, unsupported, no},
    {MODE(COLOR), false, unsupported, unsupported, no},
    {MODE(DISSOLVE), false, unsupported, unsupported, no},
    {MODE(GRAY), false, unsupported, unsupported, no},
    {MODE(HUE), false, unsupported, unsupported, no},
    {MODE(INVERT), false, unsupported, unsupported, no},
    {MODE(LUMINOSITY), false, unsupported, unsupported, no},
    {MODE(MASK), false, unsupported, unsupported, no},
    {MODE(NEGATION), false, unsupported, unsupported, no},
    {MODE(NONE), false, yes, yes, no},
    {MODE(OVER), false, unsupported, unsupported, no},
    {MODE(SATURATION), false, unsupported, unsupported, no},
    {MODE(TEST), false, unsupported, unsupported, no},
};
#undef MODE

constexpr std::size_t modeNumbers = std::size(facts);

static_assert(
    [] {
        for (std::size_t i = 0; i < modeNumbers; ++i)
            if (facts[i].mode != static_cast<KVBlendMode>(i))
                return false;
        return true;
    }(),
    "each mode stands at its number");

/// Null for what is no mode, negative numbers included.
ModeFacts const* factsOf(KVBlendMode mode) noexcept
{
    auto const number = static_cast<std::uint32_t>(mode);
    return number < modeNumbers ? &facts[number] : nullptr;
}

bool answer(KVBlendMode mode, Answer ModeFacts::*fact)
{
    ModeFacts const* const known = factsOf(mode);
    Answer const result = known ? known->*fact : illegal;
    if (result == unsupported)
        throw KVUnsupportedOperationException("not implemented yet", __FILE__, __LINE__);
    if (result == illegal)
        throw KVIllegalArgumentException(
            KVString::ssprintf("%d is no blend mode", static_cast<int>(mode)), __FILE__, __LINE__);
    return result == yes;
}

// --- Menus ---

constexpr KVBlendMode layerModes[] = {
    KV_BLEND_COMBINE,         KV_BLEND_SEPARATOR,    KV_BLEND_NORMAL,
    KV_BLEND_SEPARATOR,       KV_BLEND_SUBTRACT,     KV_BLEND_DARKEN,
    KV_BLEND_MULTIPLY,        KV_BLEND_COLOR_BURN,   KV_BLEND_LINEAR_BURN,
    KV_BLEND_SEPARATOR,       KV_BLEND_ADD,          KV_BLEND_LIGHTEN,
    KV_BLEND_SCREEN,          KV_BLEND_COLOR_DODGE,  KV_BLEND_LINEAR_DODGE,
    KV_BLEND_SEPARATOR,       KV_BLEND_OVERLAY,      KV_BLEND_SOFT_LIGHT,
    KV_BLEND_HARD_LIGHT,      KV_BLEND_VIVID_LIGHT,  KV_BLEND_LINEAR_LIGHT,
    KV_BLEND_PIN_LIGHT,       KV_BLEND_HARD_MIX,     KV_BLEND_SEPARATOR,
    KV_BLEND_DIFFERENCE,      KV_BLEND_EXCLUSION,    KV_BLEND_SEPARATOR,
    KV_BLEND_STENCIL_ALPHA,   KV_BLEND_STENCIL_LUMA, KV_BLEND_SILHOUETTE_ALPHA,
    KV_BLEND_SILHOUETTE_LUMA, KV_BLEND_BEHIND,       KV_BLEND_SEPARATOR,
    KV_BLEND_ALPHA_ADD,       KV_BLEND_LIGHT_WRAP,
};

/// What the layer menu has in front of the element menu: "Combine" and a separator.
constexpr std::size_t combineEntries = 2;

constexpr std::span<KVBlendMode const> layerMenu(layerModes);
constexpr std::span<KVBlendMode const> elementMenu = layerMenu.subspan(combineEntries);
static_assert(layerMenu.size() == 35 && elementMenu.size() == 33);

/// For each mode its first place in a menu, 0 for none.
constexpr std::array<unsigned char, modeNumbers> placesIn(std::span<KVBlendMode const> menu)
{
    std::array<unsigned char, modeNumbers> places{};
    for (std::size_t i = menu.size(); i-- > 0;)
        places[static_cast<std::size_t>(menu[i])] = static_cast<unsigned char>(i);
    return places;
}

constexpr auto layerPlaces = placesIn(layerMenu);
constexpr auto elementPlaces = placesIn(elementMenu);

// --- Texts ---

#define ELEMENT_MODES_UP_TO_EXCLUSION                                                              \
    "Normal|-|Subtract|Darken|Multiply|Color Burn|Linear Burn|-|Add|Lighten|Screen|Color "         \
    "Dodge|Linear Dodge|-|Overlay|Soft Light|Hard Light|Vivid Light|Linear Light|Pin Light|Hard "  \
    "Mix|-|Difference|Exclusion"
#define ELEMENT_MODES                                                                              \
    ELEMENT_MODES_UP_TO_EXCLUSION                                                                  \
    "|-|Stencil Alpha|Stencil Luma|Silhouette Alpha|Silhouette Luma|Behind|-|Alpha Add|Light Wrap"

/// The English texts, by their key.
constexpr struct {
    std::string_view key;
    char const* text;
} strings[] = {
    {"Blend Modes", ELEMENT_MODES},
    {"Blend Modes Combine", "Combine|-|" ELEMENT_MODES},
    {"Blend Modes Reflection", ELEMENT_MODES_UP_TO_EXCLUSION},
    {"Light Wrap Blend Modes", "Normal|Lighten|Screen|Overlay|Hard Light"},
    {"Mask Blend Modes", "Add|Subtract|Replace|Intersect"},
};
#undef ELEMENT_MODES
#undef ELEMENT_MODES_UP_TO_EXCLUSION

/// Stays for the life of the process.
KVString const& localized(char const* key)
{
    KVString text(key, "com.brovo.korvane.framework");
    if (text.toUTF8() == key) // it comes back where there is no such table
        for (auto const& string : strings)
            if (string.key == key)
                text = string.text;
    return *KVString::intern(text);
}

std::vector<KVString> split(KVString const& menu)
{
    std::u16string_view rest = menu.view();
    char16_t const separator = rest.find(u'|') != rest.npos ? u'|' : u';';
    std::vector<KVString> names;
    for (;;) {
        std::size_t const end = rest.find(separator);
        names.push_back(KVString::fromUTF16(rest.substr(0, end)));
        if (end == rest.npos)
            return names;
        rest.remove_prefix(end + 1);
    }
}

// Never freed: a host may ask for names while it is being torn down.

std::vector<KVString> const& modeNames()
{
    static auto const& names = *new std::vector<KVString>(split(KVBlend::modeMenuString(true)));
    return names;
}

std::vector<KVString> const& maskModeNames()
{
    static auto const& names = *new std::vector<KVString>(split(KVBlend::maskModeMenuString()));
    return names;
}

KVString nameAt(std::vector<KVString> const& names, std::int64_t place)
{
    bool const inside = place >= 0 && place < static_cast<std::int64_t>(names.size());
    return inside ? names[static_cast<std::size_t>(place)] : KVString(CFStringGetEmpty());
}

template <std::size_t Count>
std::ostream& printName(std::ostream& stream, char const* const (&names)[Count], std::int32_t value)
{
    if (value < 0 || value >= static_cast<std::int32_t>(Count))
        return stream << value;
    return stream << names[value];
}

} // namespace

std::ostream& operator<<(std::ostream& stream, KVBlendMode mode)
{
    if (ModeFacts const* const known = factsOf(mode))
        return stream << known->name;
    return stream << static_cast<std::int32_t>(mode);
}

std::ostream& operator<<(std::ostream& stream, KVMaskBlendMode mode)
{
    static constexpr char const* names[] = {"KV_MASK_BLEND_ADD", "KV_MASK_BLEND_SUBTRACT",
                                            "KV_MASK_BLEND_REPLACE", "KV_MASK_BLEND_INTERSECT",
                                            "KV_MASK_BLEND_SUPPORTED_LIST_END"};
    return printName(stream, names, mode);
}

std::ostream& operator<<(std::ostream& stream, KVLightWrapBlendMode mode)
{
    static constexpr char const* names[] = {"KV_LRBLEND_NORMAL", "KV_LRBLEND_LIGHTEN",
                                            "KV_LRBLEND_SCREEN", "KV_LRBLEND_OVERLAY",
                                            "KV_LRBLEND_HARD_LIGHT"};
    return printName(stream, names, mode);
}

// --- Menu texts ---

KVString KVBlend::modeMenuString(bool combine)
{
    static KVString const& layer = localized("Blend Modes Combine");
    static KVString const& element = localized("Blend Modes");
    return combine ? layer : element;
}

KVString KVBlend::lightWrapModeMenuString()
{
    static KVString const& menu = localized("Light Wrap Blend Modes");
    return menu;
}

KVString KVBlend::reflectionModeMenuString()
{
    static KVString const& menu = localized("Blend Modes Reflection");
    return menu;
}

KVString KVBlend::maskModeMenuString()
{
    static KVString const& menu = localized("Mask Blend Modes");
    return menu;
}

unsigned int KVBlend::modeCount(bool combine)
{
    std::size_t const count = modeNames().size();
    return static_cast<unsigned int>(combine ? count : count - std::min(count, combineEntries));
}

KVString KVBlend::modeName(KVBlendMode mode, bool combine)
{
    return nameAt(modeNames(), std::int64_t{mode} + (combine ? 0 : combineEntries));
}

unsigned int KVBlend::maskModeCount()
{
    return static_cast<unsigned int>(maskModeNames().size());
}

KVString KVBlend::maskModeName(KVBlendMode mode)
{
    return nameAt(maskModeNames(), mode);
}

KVString KVBlend::maskModeName(KVMaskBlendMode mode)
{
    return nameAt(maskModeNames(), mode);
}

// --- Menu places ---

KVBlendMode KVBlend::indexToElementBlendMode(unsigned int index) noexcept
{
    return index < elementMenu.size() ? elementMenu[index] : KV_BLEND_NORMAL;
}

KVBlendMode KVBlend::indexToLayerBlendMode(unsigned int index) noexcept
{
    return index < layerMenu.size() ? layerMenu[index] : KV_BLEND_NORMAL;
}

KVBlendMode KVBlend::indexToBlendMode(unsigned int index, bool layer) noexcept
{
    return layer ? indexToLayerBlendMode(index) : indexToElementBlendMode(index);
}

unsigned int KVBlend::elementBlendModeToIndex(KVBlendMode mode) noexcept
{
    return factsOf(mode) ? elementPlaces[static_cast<std::size_t>(mode)] : 0;
}

unsigned int KVBlend::layerBlendModeToIndex(KVBlendMode mode) noexcept
{
    return factsOf(mode) ? layerPlaces[static_cast<std::size_t>(mode)] : 0;
}

unsigned int KVBlend::blendModeToIndex(KVBlendMode mode, bool layer) noexcept
{
    return layer ? layerBlendModeToIndex(mode) : elementBlendModeToIndex(mode);
}

KVBlendMode const* KVBlend::getElementBlendModes(unsigned int& count) noexcept
{
    count = static_cast<unsigned int>(elementMenu.size());
    return elementMenu.data();
}

KVBlendMode const* KVBlend::getLayerBlendModes(unsigned int& count) noexcept
{
    count = static_cast<unsigned int>(layerMenu.size());
    return layerMenu.data();
}

std::span<KVBlendMode const> KVBlend::getElementBlendModes() noexcept
{
    return elementMenu;
}

std::span<KVBlendMode const> KVBlend::getLayerBlendModes() noexcept
{
    return layerMenu;
}

// --- Properties ---

bool KVBlend::isAbelian(KVBlendMode mode) noexcept
{
    ModeFacts const* const known = factsOf(mode);
    return known && known->abelian;
}

bool KVBlend::isAssociative(KVBlendMode mode)
{
    return answer(mode, &ModeFacts::associative);
}

bool KVBlend::isNormalOverNothing(KVBlendMode mode)
{
    return answer(mode, &ModeFacts::normalOverNothing);
}

bool KVBlend::isNothingOverNothing(KVBlendMode mode)
{
    return answer(mode, &ModeFacts::normalOverNothing);
}

bool KVBlend::treatsBlackLikeNormal(KVBlendMode mode)
{
    return answer(mode, &ModeFacts::blackLikeNormal);
}

KVBlendMode KVBlend::lrBlendToKVBlend(KVLightWrapBlendMode mode) noexcept
{
    switch (mode) {
    case KV_LRBLEND_LIGHTEN:
        return KV_BLEND_LIGHTEN;
    case KV_LRBLEND_SCREEN:
        return KV_BLEND_SCREEN;
    case KV_LRBLEND_OVERLAY:
        return KV_BLEND_OVERLAY;
    case KV_LRBLEND_HARD_LIGHT:
        return KV_BLEND_HARD_LIGHT;
    default:
        return KV_BLEND_NORMAL;
    }
}
