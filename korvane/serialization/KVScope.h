#pragma once

/// One row of a scope table, which gives the tokens of a host's document their names. A table
/// is an array of rows that ends with a row whose name is null; it is known by the address of
/// its first row, is never copied and must stay as it is while a stream knows it.
///
///     KVScope projectScope[] = {
///         {"project", kProject, 0},            // an element
///         {"name", kProject, kProjectName},    // an attribute of that element
///         {"clip", kClip, 0},
///         {nullptr, 0, 0},
///     };
///
/// An attribute token has meaning only together with its element's: two elements may use one
/// attribute token under different names. On reading, an element row named "*" matches every
/// element, so it belongs at the end of the last table. The first row's name stands for the
/// whole table in messages.
struct KVScope {
    char const* name;
    unsigned int elementToken;
    /// 0 in the row of an element.
    unsigned int attributeToken;
};
