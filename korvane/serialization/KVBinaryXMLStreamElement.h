#pragma once

#include <korvane/serialization/KVBinaryXMLField.h>
#include <korvane/serialization/KVStreamElement.h>

#include <utility>
#include <vector>

/// An element that KVBinaryXMLReadStream reads: one value and the attributes, each in a
/// KVBinaryXMLField, whose getters tell how values convert.
///
/// Of several values in one element the last one stays. An element without a value holds the empty
/// string. A getter of an attribute that is not there answers false or null.
class KV_EXPORT KVBinaryXMLStreamElement final : public KVStreamElement {
public:
    KVBinaryXMLStreamElement(unsigned int elementToken, KVScope* inScope,
                             KVSerializer* elementHandler);
    ~KVBinaryXMLStreamElement() override;

    // --- For the reader ---

    /// Makes room for so many attributes, or for some of them if they are many.
    void expectAttributes(unsigned int count);
    /// The last value of a token counts.
    void addAttribute(unsigned int attribute, unsigned long long value) { add(attribute, value); }
    void addAttribute(unsigned int attribute, unsigned long value) { add(attribute, value); }
    void addAttribute(unsigned int attribute, long long value) { add(attribute, value); }
    void addAttribute(unsigned int attribute, long value) { add(attribute, value); }
    void addAttribute(unsigned int attribute, float value) { add(attribute, value); }
    void addAttribute(unsigned int attribute, double value) { add(attribute, value); }
    void addAttribute(unsigned int attribute, KVUUID const& value) { add(attribute, value); }
    void addAttribute(unsigned int attribute, KVString const& value) { add(attribute, value); }
    void addAttribute(unsigned int attribute, CMTime const& value) { add(attribute, value); }

    /// Replaces the value.
    void setContent(unsigned long long value) { content_ = KVBinaryXMLField(value); }
    void setContent(unsigned long value) { content_ = KVBinaryXMLField(value); }
    void setContent(long long value) { content_ = KVBinaryXMLField(value); }
    void setContent(long value) { content_ = KVBinaryXMLField(value); }
    void setContent(float value) { content_ = KVBinaryXMLField(value); }
    void setContent(double value) { content_ = KVBinaryXMLField(value); }
    void setContent(KVUUID const& value) { content_ = KVBinaryXMLField(value); }
    void setContent(KVString const& value) { content_ = KVBinaryXMLField(value); }
    void setContent(CMTime const& value) { content_ = KVBinaryXMLField(value); }

    // --- The value ---

    KVBinaryXMLField const& content() const noexcept { return content_; }
    bool getAsString(KVString* value) override;
    bool getAsInt32(int* value) override;
    bool getAsUInt32(unsigned int* value) override;
    bool getAsInt64(long long* value) override;
    bool getAsUInt64(unsigned long long* value) override;
    bool getAsFloat(float* value) override;
    bool getAsDouble(double* value) override;
    bool getAsBool(bool* value) override;
    KVUUID* getAsUUID() override;
    bool getAsVexTime(CMTime* value) override;

    // --- Attributes ---

    bool getAttributeAsString(unsigned int attribute, KVString* value) const override;
    bool getAttributeAsInt32(unsigned int attribute, int* value) const override;
    bool getAttributeAsUInt32(unsigned int attribute, unsigned int* value) const override;
    bool getAttributeAsInt64(unsigned int attribute, long long* value) const override;
    bool getAttributeAsUInt64(unsigned int attribute, unsigned long long* value) const override;
    bool getAttributeAsFloat(unsigned int attribute, float* value) const override;
    bool getAttributeAsDouble(unsigned int attribute, double* value) const override;
    bool getAttributeAsBool(unsigned int attribute, bool* value) const override;
    KVUUID* getAttributeAsUUID(unsigned int attribute) const override;
    bool getAttributeAsVexTime(unsigned int attribute, CMTime* value) const override;

private:
    template <class T>
    void add(unsigned int attribute, T const& value)
    {
        attributes_.emplace_back(attribute, KVBinaryXMLField(value));
    }
    KVBinaryXMLField const* find(unsigned int attribute) const noexcept;

    KVBinaryXMLField content_;
    // As they come; searched from the back.
    std::vector<std::pair<unsigned int, KVBinaryXMLField>> attributes_;
};
