#include <ostream>

#include <gtest/gtest.h>

#include <nlohmann/json.hpp>

#include "FakeCommand.h"
#include "framework/Render.h"

using namespace Quillets::Cli;
using namespace FrameworkTest;

namespace {

std::shared_ptr<MetaList> TwoVolumes()
{
    auto list = MetaList::New(MetaType::Struct, VolumeShape());
    list->Add(Volume("datastore1", 1024, true));
    list->Add(Volume("big, \"quoted\"", -5, false));
    return list;
}

std::string Render(const std::shared_ptr<MetaObject>& result, const std::string& formatter,
                   const OutputHints& hints = {}, OutputOptions options = {})
{
    options.formatter = formatter;
    return RenderResult(result, result, hints, options);
}

struct RenderCase {
    const char* name;
    const char* formatter;
    OutputHints hints;
    std::optional<std::vector<std::string>> fields;
    bool showHeader;
    const char* expected;
};

// Test listings name a case by its name rather than by its bytes.
void PrintTo(const RenderCase& c, std::ostream* os) { *os << c.name; }

class ListRendering : public ::testing::TestWithParam<RenderCase> {};

TEST_P(ListRendering, PrintsExactly)
{
    const auto& c = GetParam();
    OutputOptions options;
    options.fields = c.fields;
    options.showHeader = c.showHeader;
    EXPECT_EQ(Render(TwoVolumes(), c.formatter, c.hints, options), c.expected);
}

const OutputHints kHinted{"table", {{"fields:Volume", "Mounted, Name"}, {"units:Volume.Size", "MiB"}}};

INSTANTIATE_TEST_SUITE_P(
    Formatters, ListRendering,
    ::testing::Values(
        RenderCase{"table_all_fields",
                   "table",
                   {},
                   std::nullopt,
                   true,
                   "Name           Size  Mounted\n"
                   "-------------  ----  -------\n"
                   "datastore1     1024  true\n"
                   "big, \"quoted\"  -5    false\n"},
        RenderCase{"table_hint_order_and_blanks", "table", kHinted, std::nullopt, true,
                   "Mounted  Name\n"
                   "-------  -------------\n"
                   "true     datastore1\n"
                   "false    big, \"quoted\"\n"},
        RenderCase{"table_user_fields_override_hint", "table", kHinted, std::vector<std::string>{"Size"}, false,
                   "1024\n-5\n"},
        RenderCase{"simple_units_follow_hint", "simple", kHinted, std::vector<std::string>{"Name", "Size"}, true,
                   "   Name: datastore1\n   Size: 1024 MiB\n\n   Name: big, \"quoted\"\n   Size: -5 MiB\n"},
        RenderCase{
            "simple_header_indents",
            "simple",
            {"", {{"header:Volume", "Volume %Name% (%Missing%)"}, {"fields:Volume", "Size"}}},
            std::nullopt,
            true,
            "Volume datastore1 (%Missing%)\n      Size: 1024\n\nVolume big, \"quoted\" (%Missing%)\n      Size: -5\n"},
        RenderCase{"csv_quotes_per_rfc4180", "csv", kHinted, std::nullopt, true,
                   "Mounted,Name\ntrue,datastore1\nfalse,\"big, \"\"quoted\"\"\"\n"},
        RenderCase{"json_ignores_field_hint", "json", kHinted, std::nullopt, true,
                   "[\n  {\n    \"Name\": \"datastore1\",\n    \"Size\": 1024,\n    \"Mounted\": true\n  },\n"
                   "  {\n    \"Name\": \"big, \\\"quoted\\\"\",\n    \"Size\": -5,\n    \"Mounted\": false\n  }\n]\n"},
        RenderCase{"json_user_fields", "json", kHinted, std::vector<std::string>{"Mounted"}, true,
                   "[\n  {\n    \"Mounted\": true\n  },\n  {\n    \"Mounted\": false\n  }\n]\n"}),
    [](const auto& info) { return std::string(info.param.name); });

TEST(Render, SingleStructureIsOneRowTableAndAnObject)
{
    auto single = Volume("vol", 7, true);
    EXPECT_EQ(Render(single, "table"), "Name  Size  Mounted\n----  ----  -------\nvol   7     true\n");
    EXPECT_EQ(Render(single, "simple"), "   Name: vol\n   Size: 7\n   Mounted: true\n");
    EXPECT_EQ(nlohmann::json::parse(Render(single, "json")),
              nlohmann::json({{"Name", "vol"}, {"Size", 7}, {"Mounted", true}}));
}

TEST(Render, BooleanRootIsSilentExceptInJson)
{
    for (const char* formatter : {"table", "simple", "csv"}) {
        EXPECT_EQ(Render(MetaBool::New(true), formatter), "") << formatter;
    }
    EXPECT_EQ(Render(MetaBool::New(true), "json"), "true\n");
    EXPECT_EQ(Render(MetaBool::New(false), "json"), "false\n");
    EXPECT_EQ(Render(nullptr, "json"), "");
}

TEST(Render, EmptyListKeepsHeaderInTableAndIsEmptyArrayInJson)
{
    auto empty = MetaList::New(MetaType::Struct, VolumeShape());
    EXPECT_EQ(Render(empty, "table"), "Name  Size  Mounted\n----  ----  -------\n");
    EXPECT_EQ(Render(empty, "simple"), "");
    EXPECT_EQ(Render(empty, "json"), "[]\n");
    EXPECT_EQ(Render(empty, "csv"), "Name,Size,Mounted\n");
}

TEST(Render, JsonEscapesQuotesBackslashesAndControlCharacters)
{
    auto row = MetaStruct::New("S");
    row->SetField("Text", std::string("a\"b\\c\nd\x01") + "\xff");
    const auto text = Render(row, "json");
    EXPECT_EQ(text, "{\n  \"Text\": \"a\\\"b\\\\c\\nd\\u0001\xEF\xBF\xBD\"\n}\n");
    EXPECT_EQ(nlohmann::json::parse(text)["Text"], "a\"b\\c\nd\x01\xEF\xBF\xBD");
}

TEST(Render, ControlCharactersCannotBreakHumanReadableLines)
{
    auto row = MetaStruct::New("S");
    row->SetField("Text", "two\nlines\t\x1b");
    EXPECT_EQ(Render(row, "simple"), "   Text: two\\nlines\\t\\x1b\n");
    EXPECT_EQ(Render(row, "csv"), "Text\n\"two\nlines\t\x1b\"\n");
}

TEST(Render, EmptyValuesKeepTheSimpleLineShape)
{
    auto row = MetaStruct::New("S");
    row->SetField("Empty", "");
    row->SetField("Last", "");
    EXPECT_EQ(Render(row, "simple"), "   Empty: \n   Last: \n");
    // Table lines never end in padding.
    EXPECT_EQ(Render(row, "table"), "Empty  Last\n-----  ----\n\n");
}

TEST(Render, TableWidthCountsCharactersNotBytes)
{
    auto list = MetaList::New(MetaType::Struct, nullptr);
    auto row = MetaStruct::New("S");
    row->SetField("N", "\xC3\xA9t\xC3\xA9"); // three characters, five bytes
    row->SetField("M", "x");
    list->Add(row);
    EXPECT_EQ(Render(list, "table"), "N    M\n---  -\n\xC3\xA9t\xC3\xA9  x\n");
}

TEST(Render, FieldMissingFromRowShowsDeclaredEmptyValue)
{
    auto list = MetaList::New(MetaType::Struct, VolumeShape());
    auto partial = MetaStruct::New("Volume");
    partial->SetField("Name", "only-name");
    list->Add(partial);
    EXPECT_EQ(nlohmann::json::parse(Render(list, "json")),
              nlohmann::json::parse(R"([{"Name":"only-name","Size":0,"Mounted":false}])"));
}

TEST(Render, FormatterDefaultsToCommandsThenSimple)
{
    EXPECT_EQ(EffectiveFormatter({"table", {}}, {}), Formatter::Table);
    EXPECT_EQ(EffectiveFormatter({"table", {}}, {"csv", std::nullopt, true}), Formatter::Csv);
    EXPECT_EQ(EffectiveFormatter({}, {}), Formatter::Simple);
}

TEST(Render, FieldSelectionIsCheckedAgainstDeclaredStructure)
{
    auto declared = MetaList::New(MetaType::Struct, VolumeShape());
    EXPECT_EQ(CheckFieldSelection(declared, {"Size", "Name"}), "");
    EXPECT_NE(CheckFieldSelection(declared, {"size"}).find("unknown field 'size'"), std::string::npos);
    EXPECT_NE(CheckFieldSelection(declared, {"Name", "Name"}), "");
    EXPECT_NE(CheckFieldSelection(MetaBool::New(), {"Name"}), "");
}

} // namespace
