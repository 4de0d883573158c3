#include "house/Floors.h"
#include <support/TemporaryFolder.h>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace fs = std::filesystem;
using ::testing::ElementsAre;
using ::testing::HasSubstr;
using ::testing::IsEmpty;

namespace {

/// A made-up library on disk: time and media on foundation, the two sides of platform around it.
class MadeUpTree : public ::testing::Test {
protected:
    MadeUpTree() : root_(folder_.path(""))
    {
        write("korvane/platform/CFBase.h", "#include <korvane/foundation/KVExport.h>\n");
        write("korvane/platform/NSError.h", "#include <korvane/foundation/KVString.h>\n");
        write("korvane/platform/NSError.cpp", "#include <korvane/platform/NSError.h>\n");
        write("korvane/foundation/KVExport.h", "");
        write("korvane/foundation/KVVersion.h.in", "");
        write("korvane/foundation/KVString.h", "#include <korvane/platform/CFBase.h>\n"
                                               "#include <string>\n");
        write("korvane/foundation/KVLocale_p.h", "#include <unicode/uloc.h>\n");
        write("korvane/foundation/KVString.cpp", "#include <korvane/foundation/KVLocale_p.h>\n"
                                                 "#include <korvane/foundation/KVVersion.h>\n");
        write("korvane/media/KVAtom.h", "  #  include <korvane/platform/CFBase.h>\n");
        write("korvane/korvane.h", "#include <korvane/media/KVAtom.h>\n");
    }

    void write(fs::path const& file, char const* text)
    {
        fs::create_directories((root_ / file).parent_path());
        std::ofstream(root_ / file) << text;
    }

    std::vector<std::string> faults(std::string const& moreLines = "") const
    {
        std::istringstream lines("floor platform\n"
                                 "file platform korvane/foundation/KVExport.h\n"
                                 "floor foundation platform\n"
                                 "file foundation korvane/foundation/KVString.cpp\n"
                                 "floor platform_kit foundation\n"
                                 "file platform_kit korvane/platform/NSError.cpp\n"
                                 "floor media foundation\n"
                                 "floor time foundation\n" +
                                 moreLines);
        return faultsOfTree(root_, Floors::read(lines));
    }

    TemporaryFolder folder_;
    fs::path root_;
};

} // namespace

TEST(Floors, EveryArrowOfTheLibraryGoesDown)
{
    std::ifstream lines(KORVANE_FLOORS);
    Floors const floors = Floors::read(lines);
    ASSERT_GE(floors.below.size(), 3u);
    EXPECT_THAT(faultsOfTree(KORVANE_SOURCE_DIR, floors), IsEmpty());
}

TEST_F(MadeUpTree, EveryPlantedFaultIsFound)
{
    struct Row {
        char const* file;
        char const* text;
        char const* fault;
    } const rows[] = {
        {"korvane/foundation/KVUp.h", "\n#include <korvane/media/KVAtom.h>\n",
         "KVUp.h:2: goes up from foundation to media: korvane/media/KVAtom.h"},
        {"korvane/time/KVTime.h", "#include \"korvane/media/KVAtom.h\"\n",
         "KVTime.h:1: goes up from time to media: korvane/media/KVAtom.h"},
        {"korvane/foundation/KVUp_p.h", "#include <korvane/platform/NSError.h>\n",
         "KVUp_p.h:1: goes up from foundation to platform_kit: korvane/platform/NSError.h"},
        {"korvane/platform/CFUp.h", "#include <korvane/foundation/KVString.h>\n",
         "CFUp.h:1: goes up from platform to foundation: korvane/foundation/KVString.h"},
        {"korvane/media/KVAll.h", "#include <korvane/korvane.h>\n",
         "KVAll.h:1: goes up from media to all: korvane/korvane.h"},
        {"korvane/media/KVText.h", "#include <unicode/ustring.h>\n",
         "KVText.h:1: a public header includes unicode/ustring.h"},
        {"korvane/media/KVText.h", "#include <korvane/foundation/KVLocale_p.h>\n",
         "KVText.h:1: a public header includes the private korvane/foundation/KVLocale_p.h"},
        {"korvane/media/KVText.h", "#include <korvane/media/KVGone.h>\n",
         "KVText.h:1: there is no korvane/media/KVGone.h"},
        {"korvane/media/KVOrphan.cpp", "", "KVOrphan.cpp: no floor names this source"},
    };
    EXPECT_THAT(faults(), IsEmpty());
    for (Row const& row : rows) {
        write(row.file, row.text);
        EXPECT_THAT(faults(), ElementsAre(HasSubstr(row.fault))) << row.file;
        fs::remove(root_ / row.file);
    }
}

TEST_F(MadeUpTree, FloorsThatStandOnEachOtherAreFound)
{
    EXPECT_THAT(faults("floor foundation time\n"),
                ElementsAre("foundation and time stand on each other",
                            "time and foundation stand on each other"));
}
