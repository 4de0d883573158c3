#include "SerializationSupport.h"

#include <cerrno>
#include <cstdint>
#include <random>

#include <sys/mman.h>
#include <unistd.h>

TEST(KVFileWriteStream, WritesAndEmptiesAFile)
{
    TemporaryFolder const folder;
    std::string const path = folder.write("note.txt", "something longer that was there before");
    {
        KVFileWriteStream file(urlOf(path));
        EXPECT_EQ(file.getError(), 0);
        EXPECT_TRUE(file.getURL() == urlOf(path));
        file << "Reel 12";
        EXPECT_EQ(folder.read("note.txt"), "") << "the buffer waits";
        EXPECT_EQ(file.read(nullptr, 3), 0);
    }
    EXPECT_EQ(folder.read("note.txt"), "Reel 12") << "the destructor writes the rest";
}

// The same moves and writes to a file and to memory, around the size of the file's buffer, give the
// same bytes: positions in the buffer, in front of it, behind it, and writes that cross its ends.
TEST(KVFileWriteStream, AgreesWithAMemoryStream)
{
    TemporaryFolder const folder;
    std::mt19937 random(7);
    for (int round = 0; round < 30; ++round) {
        KVBufferWriteStream memory(4096, 1024);
        KVFileWriteStream file(urlOf(folder.path("moves.bin")));
        for (int step = 0; step < 60; ++step) {
            unsigned long long const sizes[] = {0, 1, 4, 100, 20000, 51199, 51200, 51201, 70000};
            std::string const bytes(sizes[random() % std::size(sizes)],
                                    static_cast<char>('A' + random() % 26));
            memory.write(bytes.data(), bytes.size());
            file.write(bytes.data(), bytes.size());
            ASSERT_EQ(file.getPos(), memory.getPos());
            unsigned long long const end = memory.getBufferSize();
            unsigned long long const targets[] = {
                end, end, memory.getPos(), random() % (end + 1), end > 5 ? end - 5 : 0, end + 3};
            unsigned long long const target = targets[random() % std::size(targets)];
            memory.setPos(target);
            file.setPos(target);
            ASSERT_EQ(file.getPos(), target);
        }
        file.close();
        ASSERT_TRUE(folder.read("moves.bin") == textOf(memory)) << "round " << round;
    }
}

TEST(KVFileWriteStream, SaysWhatWentWrong)
{
    TemporaryFolder const folder;
    std::pair<KVURL, int> const rows[] = {
        {KVURL(), ENOENT},
        {urlOf(folder.path("missing/note.txt")), ENOENT},
        {urlOf(folder.path("")), EISDIR},
    };
    for (auto const& [url, error] : rows) {
        KVFileWriteStream file(url);
        EXPECT_EQ(file.getError(), error);
        EXPECT_THROW(file.write("x", 1), KVException_WriteError);
        EXPECT_THROW(file.setPos(0), KVException_WriteError);
        EXPECT_THROW(file.close(), KVException_WriteError);
    }
}

TEST(KVFileWriteStream, TellsOfAFullDisk)
{
    std::string const much(51200, 'x');
    {
        KVFileWriteStream file(urlOf("/dev/full"));
        file << "in the buffer";
        EXPECT_THROW(file.write(much.data(), much.size()), KVException_WriteError);
        EXPECT_EQ(file.getError(), ENOSPC);
        EXPECT_THROW(file.write("x", 1), KVException_WriteError) << "it stays failed";
    }
    KVFileWriteStream file(urlOf("/dev/full"));
    file << "in the buffer";
    try {
        file.close();
        ADD_FAILURE() << "the last bytes were lost without a word";
    } catch (KVException_WriteError const& error) {
        EXPECT_EQ(error.message().toUTF8(), "/dev/full: No space left on device");
    }
    EXPECT_NO_THROW(file.close()) << "a second close does nothing";
    EXPECT_THROW(file.write("x", 1), KVException_WriteError);
}

TEST(KVFileReadStream, ReadsThroughItsWindow)
{
    std::string bytes(200000, '\0');
    std::mt19937 random(3);
    for (char& byte : bytes)
        byte = static_cast<char>(random());
    TemporaryFolder const folder;
    KVFileReadStream file(urlOf(folder.write("read.bin", bytes)));
    std::string out(bytes.size(), '\0');
    for (int step = 0; step < 400; ++step) {
        unsigned long long const sizes[] = {0, 1, 8, 65535, 65536, 65537, 100000};
        unsigned long long const size = sizes[random() % std::size(sizes)];
        unsigned long long const position =
            random() % 3 ? random() % (bytes.size() + 10) : file.getPos();
        file.setPos(position);
        auto const expected =
            std::string_view(bytes).substr(std::min(position, 200000ull)).substr(0, size);
        ASSERT_EQ(file.read(out.data(), size), static_cast<long long>(expected.size()));
        ASSERT_EQ(file.getPos(), position + expected.size());
        ASSERT_TRUE(out.starts_with(expected));
    }
    EXPECT_EQ(file.write("x", 1), 0);
}

// Meant: what `read` returns is added to the position, -1 too.
TEST(KVFileReadStream, LowersItsPositionByAFailure)
{
    TemporaryFolder const folder;
    KVFileReadStream directory(urlOf(folder.path("")));
    char byte;
    EXPECT_EQ(directory.getError(), 0);
    EXPECT_EQ(directory.read(&byte, 1), -1);
    EXPECT_EQ(directory.getError(), EISDIR);
    EXPECT_EQ(directory.getPos(), ~0ull);

    KVFileReadStream missing(urlOf(folder.path("missing")));
    EXPECT_EQ(missing.getError(), ENOENT);
    EXPECT_EQ(missing.read(&byte, 1), -1);
    KVFileReadStream null((KVURL()));
    EXPECT_EQ(null.getError(), ENOENT);
}

// A failure between bytes that can be read: the end of a page of this process's memory with nothing
// mapped behind it.
TEST(KVFileReadStream, GoesOnAfterAFailure)
{
    auto const page = static_cast<std::size_t>(sysconf(_SC_PAGESIZE));
    void* const pages =
        mmap(nullptr, 2 * page, PROT_READ | PROT_WRITE, MAP_PRIVATE | MAP_ANONYMOUS, -1, 0);
    ASSERT_NE(pages, MAP_FAILED);
    char* const end = static_cast<char*>(pages) + page;
    munmap(end, page);
    std::copy_n("last", 4, end - 4);

    KVFileReadStream memory(urlOf("/proc/self/mem"));
    auto const position = reinterpret_cast<std::uintptr_t>(end);
    char bytes[8];
    memory.setPos(position);
    EXPECT_EQ(memory.read(bytes, 1), -1);
    EXPECT_EQ(memory.getError(), EIO);
    EXPECT_EQ(memory.getPos(), position - 1);
    memory.setPos(position - 1);
    EXPECT_EQ(memory.read(bytes, 1), 1);
    EXPECT_EQ(bytes[0], 't');
    memory.setPos(position - 4);
    EXPECT_EQ(memory.read(bytes, 8), 4) << "what there is in front of the failure";
    EXPECT_EQ(std::string(bytes, 4), "last");
    munmap(pages, page);
}
