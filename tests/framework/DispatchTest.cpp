#include <ostream>

#include <gtest/gtest.h>

#include <stdexcept>

#include "FakeCommand.h"
#include "framework/Frontend.h"

using namespace Quillets::Cli;
using namespace FrameworkTest;
using Quillets::AutoCli::Namespace;

namespace {

struct HostFailure {
    std::string message;
};

struct DispatchCase {
    const char* name;
    std::function<void(const Input&, Output&)> run;
    std::vector<std::string> extra;
    int exitCode;
    const char* out;
    const char* err;
};

// Test listings name a case by its name rather than by its bytes.
void PrintTo(const DispatchCase& c, std::ostream* os) { *os << c.name; }

class Dispatching : public ::testing::TestWithParam<DispatchCase> {};

TEST_P(Dispatching, ExitCodeAndStreams)
{
    const auto& c = GetParam();
    auto root = Namespace::New();
    auto command = FakeCommand::New();
    command->SetDefaultOutputFormatter("table");
    command->shape = [] { return MetaList::New(MetaType::Struct, VolumeShape()); };
    command->run = c.run;
    root->RegisterNamespaceNode(command, "cmd");

    DispatchHooks hooks;
    hooks.describeException = [](const std::exception_ptr& error) -> std::optional<std::string> {
        try {
            std::rethrow_exception(error);
        } catch (const HostFailure& failure) {
            return failure.message;
        } catch (...) {
            return std::nullopt;
        }
    };
    std::vector<std::string> args{"cmd"};
    args.insert(args.end(), c.extra.begin(), c.extra.end());
    const auto outcome = Dispatch(root, args, hooks);
    EXPECT_EQ(outcome.exitCode, c.exitCode);
    EXPECT_EQ(outcome.out, c.out);
    EXPECT_EQ(outcome.err, c.err);
    EXPECT_EQ(command->executions, c.exitCode == kExitUsage ? 0 : 1);
}

std::shared_ptr<MetaList> OneRow()
{
    auto list = MetaList::New(MetaType::Struct, VolumeShape());
    list->Add(Volume("v", 1, true));
    return list;
}

void ReturnsOneRow(const Input&, Output& out) { out.SetRootObject(OneRow()); }

void ReturnsRowAndErrors(const Input&, Output& out)
{
    out.SetRootObject(OneRow());
    out.AddErrorMessage("Error getting data for 'w', skipping.");
    out.AddErrorMessage("");
}

void ReportsOnlyAnError(const Input&, Output& out) { out.AddErrorMessage("No volume."); }
void ThrowsStd(const Input&, Output&) { throw std::runtime_error("broken"); }

void ReportsThenThrowsForeign(const Input&, Output& out)
{
    out.AddErrorMessage("before");
    throw HostFailure{"host is down"};
}

void ThrowsUnknown(const Input&, Output&) { throw 42; }

void ReadsUndeclared(const Input& in, Output& out)
{
    if (in.GetParameter("nmae").empty()) {
        out.SetRootObject(OneRow());
    }
}

INSTANTIATE_TEST_SUITE_P(
    Outcomes, Dispatching,
    ::testing::Values(
        DispatchCase{
            "result", ReturnsOneRow, {}, 0, "Name  Size  Mounted\n----  ----  -------\nv     1     true\n", ""},
        DispatchCase{"result_with_errors",
                     ReturnsRowAndErrors,
                     {"--formatter", "csv"},
                     1,
                     "Name,Size,Mounted\nv,1,true\n",
                     "Error getting data for 'w', skipping.\n\n"},
        DispatchCase{"errors_only", ReportsOnlyAnError, {}, 1, "", "No volume.\n"},
        DispatchCase{"std_exception", ThrowsStd, {}, 3, "", "broken\n"},
        DispatchCase{"foreign_exception_named_by_hook", ReportsThenThrowsForeign, {}, 3, "", "before\nhost is down\n"},
        DispatchCase{"unknown_exception", ThrowsUnknown, {}, 3, "", "An unknown exception stopped the command.\n"},
        DispatchCase{"undeclared_parameter_read",
                     ReadsUndeclared,
                     {},
                     3,
                     "",
                     "Command 'cmd' reads parameter 'nmae', which it does not declare.\n"},
        DispatchCase{"usage_error_runs_nothing",
                     ReturnsOneRow,
                     {"--bogus"},
                     2,
                     "",
                     "Unknown parameter '--bogus' for 'cmd'. See 'autocli cmd --help'.\n"}),
    [](const auto& info) { return std::string(info.param.name); });

TEST(Dispatch, HelpAndVersionRunNothing)
{
    auto root = Namespace::New();
    auto command = FakeCommand::New("Does it.");
    root->RegisterNamespaceNode(command, "cmd");
    auto help = Dispatch(root, {"cmd", "--help"});
    EXPECT_EQ(help.exitCode, 0);
    EXPECT_EQ(help.out, "Usage: autocli [GLOBAL OPTIONS] cmd\n\nDoes it.\n\nResult: a boolean (true on success).\n");
    auto version = Dispatch(root, {"--version"});
    EXPECT_EQ(version.exitCode, 0);
    EXPECT_EQ(version.out.rfind("autocli ", 0), 0u);
    EXPECT_EQ(command->executions, 0);
}

} // namespace
