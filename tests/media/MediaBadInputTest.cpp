// Movies that are cut short, hold wrong numbers or are no movies: the stated codes, and nothing
// worse.

#include <korvane/media/KVAtomMetadataHandler.h>

#include "media/Movie.h"

#include <gtest/gtest.h>
#include <unistd.h>

namespace {

/// Reads a movie, gives it metadata and writes it, however bad it is.
class Mill {
public:
    explicit Mill(std::string const& original)
    {
        input_ = folder_.path("in");
        run(original);
    }

    void run(std::string const& movie)
    {
        folder_.write("in", movie);
        KVAtomMetadataHandler handler;
        int const opened = handler.openInputFile(KVURL(input_.c_str()).cf_url());
        ASSERT_EQ(opened, movie.empty() ? -1 : 0);
        int const read = handler.readMetadata();
        ASSERT_TRUE(read == 0 || read == -1) << read;

        auto const metadata = makeDictionary({});
        metadata->setValue(kKVGoogleV2Metadata, makeDictionary({{"stereo_mode", "1"}}));
        metadata->setValue(kKVGoogleV1Metadata, makeDictionary({{"x", "y"}}));
        metadata->setValue(kKVHDRMetadata, makeDictionary({{"white_point_x", "1"}}));
        handler.setMetadata(metadata);
        KVURL const output(folder_.path("out").c_str());
        ASSERT_EQ(handler.openOutputFile(output.cf_url()), 0);
        int const written = handler.writeMetadataWithUpdates();
        ASSERT_TRUE(written == 0 || written == -1) << written;
        ASSERT_TRUE(fileBytes(input_) == movie) << "the input is never touched";
        if (written == 0)
            check(fileBytes(folder_.path("out")));
    }

    int written() const { return written_; }

private:
    /// What was written with success is a sound tree again, up to its end.
    void check(std::string const& movie)
    {
        ++written_;
        KVAtomBoxFile file;
        ASSERT_EQ(file.openInputFile(KVURL(folder_.path("out").c_str()).cf_url()), 0);
        ASSERT_EQ(file.readAllTrackMediaAtomBoxes(), 0);
        KVAtomBox const* const last = file.getChild(file.getChildCount() - 1);
        ASSERT_EQ(last->getOffset() + last->getSize(), movie.size());
        ASSERT_NE(movie.find("sv3d"), std::string::npos);
        ASSERT_NE(movie.find("GSpherical"), std::string::npos);
    }

    // Thousands of files go faster through memory than through a disk.
    TemporaryFolder folder_{std::filesystem::exists("/dev/shm") ? "/dev/shm" : testing::TempDir()};
    std::string input_;
    int written_ = 0;
};

} // namespace

TEST(MediaBadInput, AMovieMayEndAnywhere)
{
    for (char const* name : {"colr.mp4", "quicktime-colr.mov"}) {
        std::string const movie = fileBytes(sampleMovie(name));
        Mill mill(movie);
        ASSERT_EQ(mill.written(), 1);
        std::size_t const media = movie.find("mdat");
        for (std::size_t length = 0; length < movie.size(); length += length < media + 20 ? 1 : 61)
            ASSERT_NO_FATAL_FAILURE(mill.run(movie.substr(0, length))) << length;
        EXPECT_GT(mill.written(), 5) << "all of the tracks is there, some of the media data";
    }
}

TEST(MediaBadInput, EachNumberMayBeWrong)
{
    // Every word of the headers, wherever it starts, one at a time.
    std::string const movie = fileBytes(sampleMovie("colr.mp4"));
    std::size_t const media = movie.find("mdat") + 4;
    Mill mill(movie);
    for (std::size_t position = 0; position < media; ++position)
        for (std::uint32_t const value : {0u, 1u, 7u, 8u, 0x7FFFFFFFu, 0x80000000u, 0xFFFFFFFFu})
            ASSERT_NO_FATAL_FAILURE(mill.run(std::string(movie).replace(position, 4, be32(value))))
                << position << ' ' << value;
    EXPECT_GT(mill.written(), 100);
}
