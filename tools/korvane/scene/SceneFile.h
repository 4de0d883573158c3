#pragma once

#include "Node.h"

#include <korvane/serialization/KVHash128.h>
#include <korvane/serialization/KVStream.h>

#include <string>
#include <vector>

namespace scene {

/// The forms that a document travels in.
enum class Form { Text, Binary };

/// "text" and "binary", as `--to` names them.
char const* nameOf(Form form) noexcept;

/// Something that was passed over, and where; line 0 where lines do not count.
struct Finding {
    unsigned long line;
    std::string text;
};

/// A document that was read, and what it was read from.
struct Document {
    Node root;
    Form form = Form::Text;
    unsigned long long bytes = 0; ///< of the file
    std::vector<Finding> findings;
};

/// Reads a document; "-" is standard input. The form is told by the first bytes. Throws ToolError:
/// code 4 for what cannot be read, code 3 with the line for what is no document.
/// With `strict`, values are checked to their last character, and findings carry their lines.
void load(std::string const& path, Document& document, bool strict = false);

/// The document's bytes in that form.
void save(Node& root, Form form, KVStream& stream);
/// The hash of all values in it, which is the same in both forms.
KVHash128 hashOf(Node& root);

} // namespace scene
