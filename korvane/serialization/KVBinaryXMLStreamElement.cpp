#include <korvane/serialization/KVBinaryXMLStreamElement.h>

#include <algorithm>

KVBinaryXMLStreamElement::KVBinaryXMLStreamElement(unsigned int elementToken, KVScope* inScope,
                                                   KVSerializer* elementHandler)
    : KVStreamElement(elementToken, inScope, elementHandler)
{}

KVBinaryXMLStreamElement::~KVBinaryXMLStreamElement() = default;

void KVBinaryXMLStreamElement::expectAttributes(unsigned int count)
{
    attributes_.reserve(std::min(count, 16u));
}

KVBinaryXMLField const* KVBinaryXMLStreamElement::find(unsigned int attribute) const noexcept
{
    for (auto entry = attributes_.rbegin(); entry != attributes_.rend(); ++entry)
        if (entry->first == attribute)
            return &entry->second;
    return nullptr;
}

bool KVBinaryXMLStreamElement::getAsString(KVString* value)
{
    return content_.getAsString(value);
}

bool KVBinaryXMLStreamElement::getAsInt32(int* value)
{
    return content_.getAsInt32(value);
}

bool KVBinaryXMLStreamElement::getAsUInt32(unsigned int* value)
{
    return content_.getAsUInt32(value);
}

bool KVBinaryXMLStreamElement::getAsInt64(long long* value)
{
    return content_.getAsInt64(value);
}

bool KVBinaryXMLStreamElement::getAsUInt64(unsigned long long* value)
{
    return content_.getAsUInt64(value);
}

bool KVBinaryXMLStreamElement::getAsFloat(float* value)
{
    return content_.getAsFloat(value);
}

bool KVBinaryXMLStreamElement::getAsDouble(double* value)
{
    return content_.getAsDouble(value);
}

bool KVBinaryXMLStreamElement::getAsBool(bool* value)
{
    return content_.getAsBool(value);
}

KVUUID* KVBinaryXMLStreamElement::getAsUUID()
{
    return content_.getAsUUID();
}

bool KVBinaryXMLStreamElement::getAsVexTime(CMTime* value)
{
    return content_.getAsVexTime(value);
}

bool KVBinaryXMLStreamElement::getAttributeAsString(unsigned int attribute, KVString* value) const
{
    KVBinaryXMLField const* const field = find(attribute);
    return field && field->getAsString(value);
}

bool KVBinaryXMLStreamElement::getAttributeAsInt32(unsigned int attribute, int* value) const
{
    KVBinaryXMLField const* const field = find(attribute);
    return field && field->getAsInt32(value);
}

bool KVBinaryXMLStreamElement::getAttributeAsUInt32(unsigned int attribute,
                                                    unsigned int* value) const
{
    KVBinaryXMLField const* const field = find(attribute);
    return field && field->getAsUInt32(value);
}

bool KVBinaryXMLStreamElement::getAttributeAsInt64(unsigned int attribute, long long* value) const
{
    KVBinaryXMLField const* const field = find(attribute);
    return field && field->getAsInt64(value);
}

bool KVBinaryXMLStreamElement::getAttributeAsUInt64(unsigned int attribute,
                                                    unsigned long long* value) const
{
    KVBinaryXMLField const* const field = find(attribute);
    return field && field->getAsUInt64(value);
}

bool KVBinaryXMLStreamElement::getAttributeAsFloat(unsigned int attribute, float* value) const
{
    KVBinaryXMLField const* const field = find(attribute);
    return field && field->getAsFloat(value);
}

bool KVBinaryXMLStreamElement::getAttributeAsDouble(unsigned int attribute, double* value) const
{
    KVBinaryXMLField const* const field = find(attribute);
    return field && field->getAsDouble(value);
}

bool KVBinaryXMLStreamElement::getAttributeAsBool(unsigned int attribute, bool* value) const
{
    KVBinaryXMLField const* const field = find(attribute);
    return field && field->getAsBool(value);
}

KVUUID* KVBinaryXMLStreamElement::getAttributeAsUUID(unsigned int attribute) const
{
    KVBinaryXMLField const* const field = find(attribute);
    return field ? field->getAsUUID() : nullptr;
}

bool KVBinaryXMLStreamElement::getAttributeAsVexTime(unsigned int attribute, CMTime* value) const
{
    KVBinaryXMLField const* const field = find(attribute);
    return field && field->getAsVexTime(value);
}
