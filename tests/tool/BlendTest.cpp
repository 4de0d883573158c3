#include "tool/Tool.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <algorithm>

using ::testing::HasSubstr;
using ::testing::StartsWith;

TEST(ToolBlend, ListsTheMenus)
{
    std::string const elements = runTool({"blend", "list"}).out;
    EXPECT_THAT(elements,
                StartsWith("0\t0\tKV_BLEND_NORMAL\tNormal\n-\n2\t2\tKV_BLEND_SUBTRACT\t"));
    EXPECT_EQ(std::count(elements.begin(), elements.end(), '\n'), 33);
    std::string const layers = runTool({"blend", "list", "--layer"}).out;
    EXPECT_THAT(layers, StartsWith("0\t34\tKV_BLEND_COMBINE\tCombine\n-\n2\t0\tKV_BLEND_NORMAL\t"));
    EXPECT_THAT(layers, HasSubstr("\n34\t35\tKV_BLEND_LIGHT_WRAP\tLight Wrap\n"));
    std::string const json = runTool({"blend", "list", "--json"}).out;
    EXPECT_THAT(json, HasSubstr("\"constant\": \"KV_BLEND_SEPARATOR\",\n    \"name\": null"));
}

TEST(ToolBlend, TellsProperties)
{
    std::string const head =
        "mode\tabelian\tassociative\tnormalOverNothing\tnothingOverNothing\tblackLikeNormal\n";
    EXPECT_EQ(runTool({"blend", "properties", "add", "KV_BLEND_OVER", "stencil-luma", "37"}).out,
              head + "KV_BLEND_ADD\tyes\tyes\tyes\tyes\tyes\n"
                     "KV_BLEND_OVER\tno\t-\t-\t-\tno\n"
                     "KV_BLEND_STENCIL_LUMA\tno\tno\tno\tno\tno\n"
                     "KV_BLEND_SEPARATOR\tno\t-\t-\t-\t-\n");
    std::string const all = runTool({"blend", "properties"}).out;
    EXPECT_EQ(std::count(all.begin(), all.end(), '\n'), 53);
    EXPECT_THAT(runTool({"blend", "properties", "over", "--json"}).out,
                HasSubstr("\"associative\": null"));
    ToolResult const unknown = runTool({"blend", "properties", "addd"});
    EXPECT_EQ(unknown.exitCode, 2);
    EXPECT_EQ(unknown.messages, "korvane: \"addd\" is no blend mode\n");
}
