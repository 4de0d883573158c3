#pragma once

// The document that both forms are measured with: nested elements with five attributes each, an
// element with a value in each.

#include <korvane/korvane.h>

#include <string>
#include <vector>

constexpr unsigned int children = 3;
constexpr unsigned int depth = 8;
constexpr std::size_t documentSize = 20'000'000;

enum Token : unsigned int { kProject = 1, kClip, kOpacity, kMarker, kNote };
enum Attribute : unsigned int { kName = 1, kId, kStart, kGain, kEnabled };

// The rows of a table of the usual size, those in use not in front.
inline KVScope scope[] = {
    {"vzml", kProject, 0},    {"version", kProject, 1}, {"marker", kMarker, 0},
    {"time", kMarker, 1},     {"label", kMarker, 2},    {"color", kMarker, 3},
    {"note", kNote, 0},       {"author", kNote, 1},     {"date", kNote, 2},
    {"clip", kClip, 0},       {"name", kClip, kName},   {"id", kClip, kId},
    {"start", kClip, kStart}, {"gain", kClip, kGain},   {"enabled", kClip, kEnabled},
    {"opacity", kOpacity, 0}, {nullptr, 0, 0},
};

/// What one element holds; the same for all writers.
struct Clip {
    std::string name;
    unsigned long long id;
    CMTime start;
    float gain;
    int enabled;
    double opacity;
};

inline std::vector<Clip> const& clips()
{
    static std::vector<Clip> const made = [] {
        std::vector<Clip> list;
        for (unsigned int i = 0; i < 1000; ++i)
            list.push_back({"Shot " + std::to_string(i) + " of the opening",
                            0x100000000ull + i * 7919ull, CMTimeMake(1001 * i, 30000),
                            0.25f * static_cast<float>(i), static_cast<int>(i % 2), 1.0 / (i + 1)});
        return list;
    }();
    return made;
}

/// Calls `start(clip)` and `end()` for nested elements until `isFull()`.
template <class Start, class End, class IsFull>
void nest(Start start, End end, IsFull isFull)
{
    std::size_t next = 0;
    auto const level = [&](auto const& self, unsigned int left) -> void {
        for (unsigned int i = 0; i < children && !isFull(); ++i) {
            start(clips()[next++ % clips().size()]);
            if (left > 0)
                self(self, left - 1);
            end();
        }
    };
    while (!isFull())
        level(level, depth);
}

/// Writes clips until `isFull()`, and closes the document.
template <class IsFull>
void writeClips(KVSerializerWriteStream& stream, IsFull isFull)
{
    static std::vector<KVString> const names = [] {
        std::vector<KVString> list;
        for (Clip const& clip : clips())
            list.emplace_back(clip.name);
        return list;
    }();
    stream.pushScope(scope);
    nest(
        [&](Clip const& clip) {
            stream.startElement(kClip);
            stream.writeAttribute(kName, names[static_cast<std::size_t>(&clip - clips().data())]);
            stream.writeAttribute(kId, clip.id);
            stream.writeAttribute(kStart, clip.start);
            stream.writeAttribute(kGain, clip.gain);
            stream.writeAttribute(kEnabled, clip.enabled);
            stream.startElement(kOpacity);
            stream.writeValue(clip.opacity);
            stream.endElement();
        },
        [&] { stream.endElement(); }, isFull);
    stream.close();
}

/// Takes every attribute and every value.
class Taker : public KVIgnoreElement {
public:
    bool parseBegin(KVSerializerReadStream& stream) override
    {
        stream.pushScope(scope);
        return true;
    }
    bool parseElement(KVSerializerReadStream& stream, KVStreamElement& element) override
    {
        if (element.token == kClip) {
            KVString name;
            unsigned long long id;
            CMTime start;
            float gain;
            int enabled;
            taken += stream.getAttributeAsString(element, kName, &name);
            taken += stream.getAttributeAsUInt64(element, kId, &id);
            taken += stream.getAttributeAsVexTime(element, kStart, &start);
            taken += stream.getAttributeAsFloat(element, kGain, &gain);
            taken += stream.getAttributeAsInt32(element, kEnabled, &enabled);
        } else if (element.token == kOpacity) {
            double opacity;
            taken += stream.getAsDouble(element, &opacity);
        }
        return true;
    }
    std::size_t taken = 0;
};
