#pragma once

#include <korvane/compositing/KVBlend.h>

/// The blend mode of an effect. A plain value: a copy is independent of what it was made from.
class KVFxBlendOptions {
public:
    /// KV_BLEND_NORMAL.
    KVFxBlendOptions() noexcept = default;

    KVBlendMode getBlendMode() const noexcept { return blendMode_; }
    void setBlendMode(KVBlendMode mode) noexcept { blendMode_ = mode; }

    friend bool operator==(KVFxBlendOptions const&, KVFxBlendOptions const&) = default;

private:
    KVBlendMode blendMode_ = KV_BLEND_NORMAL;
};
