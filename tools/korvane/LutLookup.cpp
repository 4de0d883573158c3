#include "LutLookup.h"

#include <algorithm>
#include <cstddef>

namespace {

/// Where a colour lies on one axis: between point `index` and the next one.
struct Place {
    std::size_t index;
    float fraction;
};

/// What both kinds of table share: the scale of their axes and of their values.
class Lookup : public cc::lut_t::processor_t {
public:
    explicit Lookup(cc::lut_t const& table)
        : table_(table),
          minimum_(table.domainMin),
          range_(table.domainMax - table.domainMin),
          last_(static_cast<std::size_t>(table.size) - 1)
    {}

protected:
    Place placeOf(float value) const
    {
        float const scaled = (value - minimum_) / range_;
        float const clamped = !(scaled > 0.0f) ? 0.0f : scaled >= 1.0f ? 1.0f : scaled;
        float const position = clamped * static_cast<float>(last_);
        std::size_t const index = static_cast<std::size_t>(position);
        // The last point has no next one.
        std::size_t const below = last_ == 0 ? 0 : std::min(index, last_ - 1);
        return {below, position - static_cast<float>(below)};
    }
    float valueAt(std::size_t place) const { return static_cast<float>(table_.table[place]); }
    float toDomain(float value) const { return value / 65535.0f * range_ + minimum_; }
    std::size_t last() const { return last_; }

private:
    cc::lut_t const& table_;
    float minimum_;
    float range_;
    std::size_t last_;
};

class CurveLookup final : public Lookup {
public:
    using Lookup::Lookup;

    cc::rgb_t process(cc::rgb_t const& colour) const override
    {
        cc::rgb_t result;
        for (std::size_t i = 0; i < 3; ++i) {
            auto const [index, fraction] = placeOf(colour[i]);
            float const low = valueAt(index);
            float const high = valueAt(std::min(index + 1, last()));
            result[i] = toDomain(low + (high - low) * fraction);
        }
        return result;
    }
};

class CubeLookup final : public Lookup {
public:
    CubeLookup(cc::lut_t const& table, Interpolation interpolation)
        : Lookup(table), interpolation_(interpolation)
    {}

    cc::rgb_t process(cc::rgb_t const& colour) const override
    {
        Place const places[3] = {placeOf(colour[0]), placeOf(colour[1]), placeOf(colour[2])};
        cc::rgb_t result =
            interpolation_ == Interpolation::Trilinear ? trilinear(places) : tetrahedral(places);
        for (float& value : result)
            value = toDomain(value);
        return result;
    }

private:
    /// The point that lies `r`, `g` and `b` steps (0 or 1) from a cell's first corner.
    cc::rgb_t corner(Place const (&places)[3], std::size_t r, std::size_t g, std::size_t b) const
    {
        std::size_t const edge = last() + 1;
        auto const on = [&](std::size_t axis, std::size_t step) {
            return std::min(places[axis].index + step, last());
        };
        std::size_t const place = 3 * ((on(2, b) * edge + on(1, g)) * edge + on(0, r));
        return {valueAt(place), valueAt(place + 1), valueAt(place + 2)};
    }

    cc::rgb_t trilinear(Place const (&places)[3]) const
    {
        cc::rgb_t result{0, 0, 0};
        for (std::size_t bits = 0; bits < 8; ++bits) {
            float weight = 1.0f;
            for (std::size_t axis = 0; axis < 3; ++axis) {
                float const fraction = places[axis].fraction;
                weight *= bits >> axis & 1 ? fraction : 1.0f - fraction;
            }
            cc::rgb_t const point = corner(places, bits & 1, bits >> 1 & 1, bits >> 2);
            for (std::size_t i = 0; i < 3; ++i)
                result[i] += weight * point[i];
        }
        return result;
    }

    /// Walks from the first corner to the opposite one along the axes, the largest fraction first.
    cc::rgb_t tetrahedral(Place const (&places)[3]) const
    {
        std::size_t order[3] = {0, 1, 2};
        std::sort(std::begin(order), std::end(order), [&](std::size_t a, std::size_t b) {
            return places[a].fraction > places[b].fraction;
        });
        std::size_t steps[3] = {0, 0, 0};
        cc::rgb_t from = corner(places, 0, 0, 0);
        cc::rgb_t result = from;
        for (std::size_t const axis : order) {
            steps[axis] = 1;
            cc::rgb_t const to = corner(places, steps[0], steps[1], steps[2]);
            for (std::size_t i = 0; i < 3; ++i)
                result[i] += (to[i] - from[i]) * places[axis].fraction;
            from = to;
        }
        return result;
    }

    Interpolation interpolation_;
};

} // namespace

std::unique_ptr<cc::lut_t::processor_t> makeLookup(cc::lut_t const& table,
                                                   Interpolation interpolation)
{
    if (table.kind == cc::lut_t::k1D)
        return std::make_unique<CurveLookup>(table);
    return std::make_unique<CubeLookup>(table, interpolation);
}
