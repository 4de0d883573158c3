#pragma once

#include <korvane/foundation/KVExport.h>

class KVString;

/// A stream of bytes to read or to write. The ends of it are KVBufferReadStream,
/// KVBufferWriteStream, KVFileReadStream and KVFileWriteStream.
///
///     KVFileWriteStream file(KVURL("/tmp/note.txt"));
///     file << "Reel " << KVString("12") << "\n";
///     file.indent(2) << "four blanks in front\n";
///
/// A stream to read from answers 0 to `write`, one to write to answers 0 to `read`, and
/// neither moves. A stream belongs to one thread.
class KV_EXPORT KVStream {
public:
    KVStream() = default;
    KVStream(KVStream const&) = delete;
    KVStream& operator=(KVStream const&) = delete;
    virtual ~KVStream();

    /// Reads up to `length` bytes and returns how many came: fewer at the end, negative for a
    /// failure.
    virtual long long read(void* data, unsigned long long length) = 0;
    /// Writes `length` bytes and returns how many were taken. Throws KVException_WriteError when
    /// the bytes cannot be written.
    virtual long long write(void const* data, unsigned long long length) = 0;
    /// In bytes from the start.
    virtual unsigned long long getPos() = 0;
    /// Goes to a position. What one behind the end does, each stream tells.
    virtual void setPos(unsigned long long position) = 0;
    /// The `errno` value of the first failure, which stays; 0 when there was none.
    virtual int getError() const = 0;

    /// Writes two blanks for each level. They come from a constant of 39 blanks and a zero byte,
    /// 20 levels at a time, so byte 40 of every full block of 20 levels is zero.
    KVStream& indent(unsigned int levels);
    /// Writes the text without its terminator; nothing for null.
    KVStream& operator<<(char const* text);
    /// Writes the first `text.size()` bytes of the text's UTF-8 form. The size counts UTF-16
    /// units, so only ASCII text is written whole.
    KVStream& operator<<(KVString const& text);
};
