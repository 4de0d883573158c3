#include <korvane/serialization/KVXMLProlog_p.h>

#include <algorithm>
#include <string>

// A document that is fine has at most
//
//     <?xml version="1.0" encoding="UTF-8"?>
//     <!-- comments --> <?instructions?>
//     <!DOCTYPE vzxmlscene [
//       <!ENTITY space " ">
//     ]>
//
// in front of its root element. The scanner follows the grammar of XML 1.0 (fifth edition), 2.8
// and 4.2 as far as it must to find the entities; where the document strays from it, libxml2 stops.

namespace {

using Kind = KVXMLProlog::Kind;

constexpr std::size_t npos = std::string_view::npos;
constexpr std::size_t mostOfSubset = 8192;
constexpr char blanks[] = " \t\r\n";
/// In the place of characters that are not ASCII: means nothing in any construct.
constexpr char notASCII = '\x7F';

struct Finding {
    Kind kind;
    char const* reason = "";
    std::size_t at = 0;
};

constexpr Finding incomplete{Kind::incomplete};
constexpr Finding fine{Kind::fine};

Finding refuse(char const* reason, std::size_t at)
{
    return {Kind::refused, reason, at};
}

std::size_t findPast(std::string_view text, std::string_view end, std::size_t at)
{
    std::size_t const found = text.find(end, at);
    return found == npos ? npos : found + end.size();
}

/// Goes behind a comment or an instruction, if one starts at `at`.
Finding skipAside(std::string_view text, std::size_t& at)
{
    std::string_view const rest = text.substr(at);
    if (rest.starts_with("<!--")) {
        std::size_t const dashes = text.find("--", at + 4);
        if (dashes == npos || dashes + 2 == text.size())
            return incomplete;
        if (text[dashes + 2] != '>')
            return refuse("a comment holds two dashes", dashes);
        at = dashes + 3;
    } else if (rest.starts_with("<?")) {
        at = findPast(text, "?>", at + 2);
        if (at == npos)
            return incomplete;
    }
    return fine;
}

/// Whether the text of an entity, once its character references are replaced as they are when it is
/// declared, refers to an entity.
bool refersFurther(std::string_view literal)
{
    std::string value;
    for (std::size_t at = 0; at < literal.size(); ++at) {
        std::size_t const end = literal.substr(at, 2) == "&#" ? literal.find(';', at) : npos;
        if (end == npos) {
            value += literal[at];
            continue;
        }
        std::string_view digits = literal.substr(at + 2, end - at - 2);
        unsigned int const base = digits.starts_with('x') ? 16 : 10;
        if (base == 16)
            digits.remove_prefix(1);
        unsigned long code = 0;
        for (char const digit : digits)
            code =
                std::min(code * base + static_cast<unsigned long>(
                                           digit <= '9' ? digit - '0' : (digit | 0x20) - 'a' + 10),
                         0x110000ul);
        value += code == '&' ? '&' : '?';
        at = end;
    }
    for (std::size_t at = value.find('&'); at != npos; at = value.find('&', at + 1))
        if (value.compare(at, 2, "&#") != 0)
            return true;
    return false;
}

/// Goes to the end of the declaration that `at` stands in. Literals of entities are looked into.
Finding scanDeclaration(std::string_view text, std::size_t& at, bool isEntity)
{
    for (;;) {
        at = text.find_first_of("\"'>", at);
        if (at == npos)
            return incomplete;
        if (text[at] == '>') {
            ++at;
            return fine;
        }
        std::size_t const end = text.find(text[at], at + 1);
        if (end == npos)
            return incomplete;
        if (isEntity && refersFurther(text.substr(at + 1, end - at - 1)))
            return refuse("an entity that refers to another one is declared", at);
        at = end + 1;
    }
}

/// Declarations, up to "]".
Finding scanDeclarations(std::string_view text, std::size_t at)
{
    for (;;) {
        at = text.find_first_not_of(blanks, at);
        if (at == npos)
            return incomplete;
        if (text[at] == ']')
            return fine;
        std::string_view const rest = text.substr(at);
        if (rest.size() < sizeof "<!ENTITY" - 1)
            return incomplete;
        std::size_t const start = at;
        if (Finding const finding = skipAside(text, at); finding.kind != Kind::fine)
            return finding;
        if (at != start)
            continue;
        if (rest.starts_with("<!")) {
            bool const isEntity = rest.starts_with("<!ENTITY");
            if (isEntity) {
                at = text.find_first_not_of(blanks, at + sizeof "<!ENTITY" - 1);
                if (at == npos)
                    return incomplete;
                if (text[at] == '%')
                    return refuse("a parameter entity is declared", start);
            }
            if (Finding const finding = scanDeclaration(text, at, isEntity);
                finding.kind != Kind::fine)
                return finding;
        } else {
            return refuse("the document type is not well-formed", at);
        }
    }
}

Finding scanSubset(std::string_view text, std::size_t start)
{
    Finding const finding = scanDeclarations(text.substr(0, start + mostOfSubset), start);
    bool const tooLong = finding.kind == Kind::incomplete && text.size() > start + mostOfSubset;
    return tooLong ? refuse("the document type declares too much", start) : finding;
}

Finding scanDocumentType(std::string_view text, std::size_t at)
{
    for (;;) {
        at = text.find_first_of("\"'[>", at);
        if (at == npos)
            return incomplete;
        if (text[at] == '>')
            return fine;
        if (text[at] == '[')
            return scanSubset(text, at + 1);
        at = findPast(text, text.substr(at, 1), at + 1);
        if (at == npos)
            return incomplete;
    }
}

bool isNameOf(std::string_view name, std::initializer_list<std::string_view> starts)
{
    return std::any_of(starts.begin(), starts.end(), [name](std::string_view start) {
        return name.size() >= start.size() &&
               std::equal(start.begin(), start.end(), name.begin(), [](char a, char b) {
                   return a == (b >= 'a' && b <= 'z' ? b - 0x20 : b);
               });
    });
}

/// An encoding that is declared must be one in which the scanner reads what libxml2 will.
Finding scanEncoding(std::string_view text, bool isWide)
{
    if (!text.starts_with("<?xml"))
        return fine;
    std::size_t const end = text.find("?>");
    if (end == npos)
        return incomplete;
    std::string_view const declaration = text.substr(0, end);
    constexpr std::string_view key = "encoding";
    for (std::size_t at = declaration.find(key); at != npos; at = declaration.find(key, at + 1)) {
        std::size_t const start = declaration.find_first_of("\"'", at);
        std::size_t const stop =
            start == npos ? npos : declaration.find(declaration[start], start + 1);
        if (stop == npos)
            continue;
        std::string_view const name = declaration.substr(start + 1, stop - start - 1);
        if (isWide ? !isNameOf(name, {"UTF-16"})
                   : !isNameOf(name, {"UTF-8", "UTF8", "US-ASCII", "ASCII", "ISO-8859-",
                                      "ISO-LATIN-1", "WINDOWS-125", "CP125"}))
            return refuse("its encoding is not read", at);
    }
    return fine;
}

Finding scan(std::string_view text, bool isWide)
{
    if (Finding const finding = scanEncoding(text, isWide); finding.kind != Kind::fine)
        return finding;
    constexpr std::string_view documentType = "<!DOCTYPE";
    for (std::size_t at = 0;;) {
        at = text.find_first_not_of(blanks, at);
        if (at == npos)
            return incomplete;
        std::string_view const rest = text.substr(at);
        std::size_t const start = at;
        if (Finding const finding = skipAside(text, at); finding.kind != Kind::fine)
            return finding;
        if (at != start)
            continue;
        if (rest.starts_with(documentType))
            return scanDocumentType(text, at + documentType.size());
        // The start of an element, unless what is here could still become one of the above.
        bool const open =
            documentType.starts_with(rest) || std::string_view("<!--").starts_with(rest);
        return open ? incomplete : fine;
    }
}

} // namespace

KVXMLEncoding kvDetectEncoding(std::string_view bytes)
{
    auto const starts = [bytes](std::string_view mark) { return bytes.starts_with(mark); };
    using namespace std::string_view_literals;
    if (starts("\0\0\xFE\xFF"sv) || starts("\xFF\xFE\0\0"sv) || starts("\0\0\0<"sv) ||
        starts("<\0\0\0"sv) || starts("\0\0<\0"sv) || starts("\0<\0\0"sv) ||
        starts("\x4C\x6F\xA7\x94"sv))
        return {0, false};
    bool const bigEndian = starts("\xFE\xFF"sv) || starts("\0<"sv);
    return {bigEndian || starts("\xFF\xFE"sv) || starts("<\0"sv) ? 2 : 1, bigEndian};
}

std::string_view kvNarrowed(KVXMLEncoding encoding, std::string_view bytes, std::string& buffer)
{
    if (encoding.width != 2)
        return bytes;
    buffer.clear();
    for (std::size_t i = 0; i + 1 < bytes.size(); i += 2) {
        char const high = bytes[i + (encoding.bigEndian ? 0 : 1)];
        char const low = bytes[i + (encoding.bigEndian ? 1 : 0)];
        buffer += high == 0 && static_cast<unsigned char>(low) < 0x80 ? low : notASCII;
    }
    return buffer;
}

KVXMLProlog kvScanProlog(KVXMLEncoding encoding, std::string_view bytes)
{
    if (encoding.width == 0)
        return {Kind::refused, "its encoding is not read", 1};
    std::string buffer;
    std::string_view text = kvNarrowed(encoding, bytes, buffer);
    if (encoding.width == 2 && text.starts_with(notASCII))
        text.remove_prefix(1); // the byte order mark
    else if (text.starts_with("\xEF\xBB\xBF"))
        text.remove_prefix(3);
    Finding const finding = scan(text, encoding.width == 2);
    auto const lines =
        std::count(text.begin(), text.begin() + static_cast<std::ptrdiff_t>(finding.at), '\n');
    return {finding.kind, finding.reason, static_cast<unsigned long>(lines) + 1};
}
