#include <ostream>
#include <tuple>

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

std::shared_ptr<MetaStruct> Row(const std::vector<std::pair<const char*, std::string>>& fields)
{
    auto row = MetaStruct::New("S");
    for (const auto& [name, value] : fields) {
        row->SetField(name, value);
    }
    return row;
}

TEST(Render, RootShapesPerFormatter)
{
    auto empty = MetaList::New(MetaType::Struct, VolumeShape());
    auto wide = MetaList::New(MetaType::Struct, nullptr);
    wide->Add(Row({{"N", "\xC3\xA9t\xC3\xA9"}, {"M", "x"}})); // three characters, five bytes
    const auto control = Row({{"Text", "two\nlines\t\x1b"}});
    const auto blanks = Row({{"Empty", ""}, {"Last", ""}});
    const std::vector<std::tuple<std::shared_ptr<MetaObject>, const char*, std::string>> cases{
        {Volume("vol", 7, true), "table", "Name  Size  Mounted\n----  ----  -------\nvol   7     true\n"},
        {Volume("vol", 7, true), "simple", "   Name: vol\n   Size: 7\n   Mounted: true\n"},
        {Volume("vol", 7, true), "json", "{\n  \"Name\": \"vol\",\n  \"Size\": 7,\n  \"Mounted\": true\n}\n"},
        {MetaBool::New(true), "table", ""},
        {MetaBool::New(true), "simple", ""},
        {MetaBool::New(true), "csv", ""},
        {MetaBool::New(true), "json", "true\n"},
        {MetaBool::New(false), "json", "false\n"},
        {nullptr, "json", ""},
        {empty, "table", "Name  Size  Mounted\n----  ----  -------\n"},
        {empty, "simple", ""},
        {empty, "json", "[]\n"},
        {empty, "csv", "Name,Size,Mounted\n"},
        {wide, "table", "N    M\n---  -\n\xC3\xA9t\xC3\xA9  x\n"},
        // Control characters cannot break a human-readable line; csv quotes them instead.
        {control, "simple", "   Text: two\\nlines\\t\\x1b\n"},
        {control, "csv", "Text\n\"two\nlines\t\x1b\"\n"},
        // Empty values keep the line shape, and table lines never end in padding.
        {blanks, "simple", "   Empty: \n   Last: \n"},
        {blanks, "table", "Empty  Last\n-----  ----\n\n"},
    };
    for (const auto& [object, formatter, expected] : cases) {
        EXPECT_EQ(Render(object, formatter), expected) << formatter << " of " << expected;
    }
    const auto text = Render(Row({{"Text", std::string("a\"b\\c\nd\x01") + "\xff"}}), "json");
    EXPECT_EQ(text, "{\n  \"Text\": \"a\\\"b\\\\c\\nd\\u0001\xEF\xBF\xBD\"\n}\n");
    EXPECT_EQ(nlohmann::json::parse(text)["Text"], "a\"b\\c\nd\x01\xEF\xBF\xBD");
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

TEST(Render, FieldSelectionIsCheckedAgainstDeclaredStructure)
{
    auto declared = MetaList::New(MetaType::Struct, VolumeShape());
    EXPECT_EQ(CheckFieldSelection(declared, {"Size", "Name"}), "");
    EXPECT_NE(CheckFieldSelection(declared, {"size"}).find("unknown field 'size'"), std::string::npos);
    EXPECT_NE(CheckFieldSelection(declared, {"Name", "Name"}), "");
    EXPECT_NE(CheckFieldSelection(MetaBool::New(), {"Name"}), "");
}

} // namespace
