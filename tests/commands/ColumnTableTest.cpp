// Column tables: the hints and rows they give, and the mistakes they refuse. What the
// commands print from them is covered by the fixture cases.

#include <functional>
#include <map>
#include <stdexcept>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "command/Columns.h"
#include "support/HostFixture.h"

using namespace OrvaneCli::FileSystem;

namespace {

enum Field { kName, kSize, kMounted, kBinding, kHidden, kMoved, kUnknown };

// A table using every option: a unit, a hidden column, a switched column and one shown
// elsewhere than its place in the structure.
const ColumnTable kTable("Sample",
                         {{kName, "Name"},
                          {kSize, "Size", ColumnType::Int, {.unit = "MiB"}},
                          {kMounted, "Mounted", ColumnType::Bool},
                          {kBinding, "Binding", ColumnType::String, {.feature = Feature::NfsKnxnicBinding}},
                          {kHidden, "Hidden", ColumnType::String, {.shown = false}},
                          {kMoved, "Moved", ColumnType::Int, {.shownAfter = kName}}},
                         true, "%Name%");

std::vector<std::string> Titles(const MetaStruct& structure)
{
    std::vector<std::string> titles;
    for (std::size_t i = 0; i < structure.GetFieldCount(); ++i) {
        titles.push_back(structure.GetFieldTitle(i));
    }
    return titles;
}

TEST(ColumnTableTest, StructureAndHintsFollowTheSwitches)
{
    for (const bool on : {true, false}) {
        SCOPED_TRACE(on ? "switch on" : "switch off");
        TestSupport::ScopedHost host(on ? R"({"features": {"104": true}})" : R"({"features": {"104": false}})");
        const std::vector<std::string> structure =
            on ? std::vector<std::string>{"Name", "Size", "Mounted", "Binding", "Hidden", "Moved"}
               : std::vector<std::string>{"Name", "Size", "Mounted", "Hidden", "Moved"};
        EXPECT_EQ(Titles(*kTable.Shape().Empty()), structure);

        class Probe : public Quillets::AutoCli::CommandSpec {
        } probe;
        kTable.DeclareHints(probe);
        const std::map<std::string, std::string> hints = {
            {"fields:Sample", on ? "Name,Moved,Size,Mounted,Binding" : "Name,Moved,Size,Mounted"},
            {"header:Sample", "%Name%"},
            {"units:Sample.Size", "MiB"},
        };
        EXPECT_EQ(probe.GetDefaultOutputParameters(), hints);
    }
}

TEST(ColumnTableTest, FillingAFieldTheShapeDoesNotHaveThrows)
{
    TestSupport::ScopedHost host(R"({"features": {"104": false}})");
    const RowShape shape = kTable.Shape();
    struct Case {
        const char* what;
        std::function<void(Row&)> fill;
        bool throws;
    };
    const std::vector<Case> cases = {
        {"declared string", [](Row& row) { row.Set(kName, "a"); }, false},
        {"declared integer", [](Row& row) { row.Set(kSize, 5L); }, false},
        {"hidden column", [](Row& row) { row.Set(kHidden, std::string("h")); }, false},
        {"undeclared field", [](Row& row) { row.Set(kUnknown, "x"); }, true},
        {"column switched off", [](Row& row) { row.Set(kBinding, "knx0"); }, true},
        {"string into an integer", [](Row& row) { row.Set(kSize, "5"); }, true},
        {"integer into a boolean", [](Row& row) { row.Set(kMounted, 1); }, true},
        {"boolean into a string", [](Row& row) { row.Set(kName, true); }, true},
    };
    for (const auto& c : cases) {
        SCOPED_TRACE(c.what);
        Row row = shape.NewRow();
        if (c.throws) {
            EXPECT_THROW(c.fill(row), std::logic_error);
            // Nothing was added: the row keeps exactly the table's fields.
            EXPECT_EQ(Titles(*row.Structure()), Titles(*shape.Empty()));
        } else {
            EXPECT_NO_THROW(c.fill(row));
        }
    }
}

TEST(ColumnTableTest, SetIfPresentAsksOnlyForColumnsTheShapeHas)
{
    for (const bool on : {true, false}) {
        SCOPED_TRACE(on ? "switch on" : "switch off");
        TestSupport::ScopedHost host(on ? R"({"features": {"104": true}})" : R"({"features": {"104": false}})");
        const RowShape shape = kTable.Shape();
        Row row = shape.NewRow();
        int reads = 0;
        row.SetIfPresent(kBinding,
                         [&] {
                             ++reads;
                             return std::string("knx0");
                         })
            .SetIfPresent(kSize, [&] {
                ++reads;
                return 7L;
            });
        EXPECT_EQ(reads, on ? 2 : 1);
        EXPECT_EQ(Titles(*row.Structure()), Titles(*shape.Empty()));
        // A wrong type is still refused when the column is there.
        EXPECT_THROW(row.SetIfPresent(kSize, [] { return true; }), std::logic_error);
    }
}

TEST(ColumnTableTest, BrokenTablesAreRefused)
{
    TestSupport::ScopedHost host("{}");
    EXPECT_THROW(ColumnTable("Twice", {{kName, "Name"}, {kName, "Other"}}), std::logic_error);
    const ColumnTable afterHidden("After", {{kHidden, "Hidden", ColumnType::String, {.shown = false}},
                                            {kMoved, "Moved", ColumnType::Int, {.shownAfter = kHidden}}});
    class Probe : public Quillets::AutoCli::CommandSpec {
    } probe;
    EXPECT_THROW(afterHidden.DeclareHints(probe), std::logic_error);
}

} // namespace
