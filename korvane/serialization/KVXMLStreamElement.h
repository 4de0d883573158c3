#pragma once

#include <korvane/foundation/KVString.h>
#include <korvane/serialization/KVStreamElement.h>

#include <map>
#include <memory>
#include <string>

/// An element of a document in text form. Handlers meet it as a KVStreamElement.
///
/// Its text is read by the typed getters from a cursor, which each of them moves behind what it
/// read and the blanks that follow, so that a run of them reads a list of numbers:
///
///     while (element.getAsDouble(&x) && element.getAsDouble(&y))     // "0 1.5  2 7.25"
///         points.push_back({x, y});
///
/// Numbers are read as the C functions do: what stops the number is no failure. "12abc" gives 12
/// and leaves the cursor on "abc", "abc" gives 0, and both answer true. A number out of range
/// gives false, with the output set to what that function gives (for `getAsInt32`, which reads 64
/// bits, cut to 32). No text at the cursor gives false. `getAsBool` reads a number: "true" is 0.
/// Attributes are read in the same way, but that an empty one reads as 0.
class KV_EXPORT KVXMLStreamElement final : public KVStreamElement {
public:
    KVXMLStreamElement(unsigned int elementToken, KVScope* inScope, KVSerializer* elementHandler);
    ~KVXMLStreamElement() override;

    /// The whole text, whatever the cursor, with "&amp;" and then "&lt;", "&gt;" and "&quot;"
    /// replaced. The parser has replaced them once already: a text that was "&amp;amp;lt;" in the
    /// document ends as "<". Made at the first call that finds text, which is all that later calls
    /// see; a text that is not UTF-8 gives the null string. Always true.
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

    /// The value as the parser gives it, with nothing replaced again.
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
    /// The line of the element's start tag, in a stream with an observer; else 0.
    unsigned long line() const noexcept { return line_; }
    /// The value in UTF-8, null when the attribute is absent; valid until another one is added.
    char const* getAttributeAsCString(unsigned int attribute) const noexcept;

    /// Copies the text and sets the cursor back to the start. Null adds nothing.
    void appendContentWithNewline(char* text, bool newline) override;
    bool isXMLStreamElement() override;

    /// Adds the value under the token of each row of the element's table that names this attribute
    /// of this element; under none when there is no such row.
    void addAttribute(char const* name, char const* value);
    /// Adds a copy of the value. Of a token that comes twice, the first value counts among the
    /// first seven attributes and the last one behind those.
    void addAttribute(unsigned int attribute, char const* value);

private:
    friend class KVXMLReadStream;

    struct Storage {
        std::string content;
        /// The attributes' values, each with its terminator.
        std::string values;
    };
    struct Attribute {
        unsigned int token;
        /// Where its value starts.
        std::size_t value;
    };

    /// With memory that the elements of one depth use one after the other.
    KVXMLStreamElement(unsigned int elementToken, KVScope* inScope, KVSerializer* elementHandler,
                       Storage& storage) noexcept;

    template <class T, class Parse>
    bool readContent(T* value, Parse parse);
    template <class T, class Parse>
    bool readAttribute(unsigned int attribute, T* value, Parse parse) const;
    char const* cursor() const noexcept;
    void setCursor(char const* position) noexcept;

    KVString stringValue_;
    /// Where the next typed getter reads, in the content.
    std::size_t cursor_ = 0;
    unsigned long line_ = 0;
    bool hasContent_ = false;
    std::unique_ptr<Storage> ownStorage_;
    Storage& storage_;
    Attribute attributes_[7];
    unsigned int attributeCount_ = 0;
    /// From the eighth on.
    std::unique_ptr<std::map<unsigned int, std::size_t>> moreAttributes_;
};
