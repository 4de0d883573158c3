#pragma once

#include <korvane/compositing/KVFxBlendOptions.h>

/// How the light of a background is wrapped around a layer's edges: how far it reaches (`amount`),
/// how strong it is (`intensity`), how much of it shows (`opacity`), in the host's own ranges, and
/// how it is laid over the layer. A plain value, like the blend options that it extends.
class KVFxLightWrapOptions : public KVFxBlendOptions {
public:
    /// Zeros and KV_LRBLEND_NORMAL.
    KVFxLightWrapOptions() noexcept = default;

    float getAmount() const noexcept { return amount_; }
    void setAmount(float amount) noexcept { amount_ = amount; }
    float getIntensity() const noexcept { return intensity_; }
    void setIntensity(float intensity) noexcept { intensity_ = intensity; }
    float getOpacity() const noexcept { return opacity_; }
    void setOpacity(float opacity) noexcept { opacity_ = opacity; }
    KVLightWrapBlendMode getLRBlendMode() const noexcept { return blendMode_; }
    void setLRBlendMode(KVLightWrapBlendMode mode) noexcept { blendMode_ = mode; }

    friend bool operator==(KVFxLightWrapOptions const&, KVFxLightWrapOptions const&) = default;

private:
    float amount_ = 0.0f;
    float intensity_ = 0.0f;
    float opacity_ = 0.0f;
    KVLightWrapBlendMode blendMode_ = KV_LRBLEND_NORMAL;
};
