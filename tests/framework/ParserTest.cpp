#include <ostream>

#include <gtest/gtest.h>

#include "FakeCommand.h"
#include "framework/Help.h"
#include "framework/Parser.h"
#include "quillets/QuilletException.h"

using namespace Quillets::Cli;
using namespace FrameworkTest;
using Quillets::AutoCli::Namespace;
using Quillets::AutoCli::NamespaceNode;

namespace {

std::shared_ptr<ParameterConstraint> Range(long min, long max)
{
    auto constraint = ParameterConstraint::New(ParameterConstraintType::IntRange);
    constraint->SetIntRange(min, max);
    return constraint;
}

std::shared_ptr<ParameterConstraint> Levels()
{
    auto constraint = ParameterConstraint::New(ParameterConstraintType::StringEnum);
    constraint->AddStringEnum("low", "Little");
    constraint->AddStringEnum("high");
    return constraint;
}

// storage volume set, with one parameter of every kind.
struct Tree {
    std::shared_ptr<NamespaceNode> root = Namespace::New();
    std::shared_ptr<FakeCommand> set = FakeCommand::New("Change a volume.");

    Tree()
    {
        auto storage = Namespace::New();
        auto volume = Namespace::New();
        volume->SetDescription("Volume operations.");
        set->describe = [](InputSpec& inputs, FakeCommand& self) {
            inputs.AddParameter(Param("name", "n", ParameterType::String, true));
            inputs.AddParameter(Param("depth", "q", ParameterType::Int, false, Range(1, 4294967295L)));
            inputs.AddParameter(Param("big", "", ParameterType::Int));
            inputs.AddParameter(Param("enabled", "e", ParameterType::Bool));
            inputs.AddParameter(Param("force", "f", ParameterType::Flag));
            inputs.AddParameter(Param("hosts", "H", ParameterType::StringList));
            inputs.AddParameter(Param("level", "l", ParameterType::String, false, Levels()));
            inputs.AddParameter(Param("Index", "I", ParameterType::String));
            inputs.AddParameter(Param("index", "i", ParameterType::String));
            self.AddExample("-n vol1", "Change vol1.");
        };
        set->shape = [] { return MetaList::New(MetaType::Struct, VolumeShape()); };
        volume->RegisterNamespaceNode(set, "set");
        storage->RegisterNamespaceNode(volume, "volume");
        root->RegisterNamespaceNode(storage, "storage");
    }

    Invocation Parse(std::vector<std::string> args)
    {
        args.insert(args.begin(), {"storage", "volume", "set"});
        return ParseCommandLine(root, args);
    }
};

TEST(Parser, ReadsEveryParameterKind)
{
    Tree tree;
    auto inv = tree.Parse({"-n", "-dash-", "--depth=4294967295", "--big", "-9223372036854775808", "-e", "OFF", "-f",
                           "-H", "a,b", "--hosts", "c", "-l", "low", "-I", "upper", "-i", "lower"});
    ASSERT_EQ(inv.action, Invocation::Action::Run) << inv.error;
    const auto& in = *inv.input;
    EXPECT_EQ(in.GetParameter("name"), "-dash-");
    EXPECT_EQ(in.GetParameterInt("depth"), 4294967295LL);
    EXPECT_EQ(in.GetParameterInt("big"), INT64_MIN);
    EXPECT_TRUE(in.HasParameter("enabled"));
    EXPECT_FALSE(in.GetParameterBool("enabled"));
    EXPECT_TRUE(in.IsFlagSet("force"));
    std::vector<std::string> hosts;
    in.GetParameterList("hosts", hosts);
    EXPECT_EQ(hosts, (std::vector<std::string>{"a", "b", "c"}));
    EXPECT_EQ(in.GetParameter("level"), "low");
    EXPECT_EQ(in.GetParameter("Index"), "upper");
    EXPECT_EQ(in.GetParameter("index"), "lower");
    EXPECT_THROW(in.HasParameter("missing"), Quillets::QuilletException);
}

TEST(Parser, GlobalOptionsBeforeAndAfterThePath)
{
    Tree tree;
    auto inv =
        ParseCommandLine(tree.root, {"--state", "/tmp/s.json", "--formatter=json", "storage", "volume", "set", "-n",
                                     "x", "--format-param", "fields=Size, Name", "--format-param=show-header=no"});
    ASSERT_EQ(inv.action, Invocation::Action::Run) << inv.error;
    EXPECT_EQ(inv.globals.statePath, "/tmp/s.json");
    EXPECT_EQ(inv.globals.output.formatter, "json");
    EXPECT_EQ(inv.globals.output.fields, (std::vector<std::string>{"Size", "Name"}));
    EXPECT_FALSE(inv.globals.output.showHeader);
}

struct UsageCase {
    const char* name;
    std::vector<std::string> args; // after "storage volume set" unless `whole`
    bool whole;
    std::string expected;
};

// A mistake after the path "storage volume set": the message ends by pointing to that command's help.
UsageCase OnSet(const char* name, std::vector<std::string> args, const std::string& problem)
{
    return {name, std::move(args), false, problem + " See 'autocli storage volume set --help'."};
}

UsageCase Whole(const char* name, std::vector<std::string> args, const char* expected)
{
    return {name, std::move(args), true, expected};
}

// Test listings name a case by its name rather than by its bytes.
void PrintTo(const UsageCase& c, std::ostream* os) { *os << c.name; }

class UsageErrors : public ::testing::TestWithParam<UsageCase> {};

TEST_P(UsageErrors, NameTheProblemAndPointToHelp)
{
    const auto& c = GetParam();
    Tree tree;
    auto inv = c.whole ? ParseCommandLine(tree.root, c.args) : tree.Parse(c.args);
    EXPECT_EQ(inv.action, Invocation::Action::UsageError);
    EXPECT_EQ(inv.error, c.expected);
    EXPECT_EQ(inv.error.find('\n'), std::string::npos);
    EXPECT_EQ(tree.set->executions, 0);
}

INSTANTIATE_TEST_SUITE_P(
    EachClass, UsageErrors,
    ::testing::Values(
        Whole("unknown_top_level", {"nope"},
              "Unknown namespace or command 'nope' at the top level. See 'autocli --help'."),
        Whole("namespace_without_command", {"storage", "volume"},
              "'storage volume' is a namespace: name one of its commands. See 'autocli storage volume --help'."),
        Whole("no_command", {}, "No command given. See 'autocli --help'."),
        Whole("unknown_global", {"--verbose"}, "Unknown option '--verbose'. See 'autocli --help'."),
        OnSet("short_names_are_case_sensitive", {"-n", "x", "-F"}, "Unknown parameter '-F' for 'storage volume set'."),
        OnSet("missing_value", {"-n"}, "Missing value for parameter '--name'."),
        OnSet("int_junk", {"-n", "x", "-q", "12abc"},
              "Invalid value '12abc' for '--depth': expected a 64-bit decimal integer."),
        OnSet("int_beyond_64_bits", {"-n", "x", "--big", "9223372036854775808"},
              "Invalid value '9223372036854775808' for '--big': expected a 64-bit decimal integer."),
        OnSet("enum_is_case_sensitive", {"-n", "x", "-l", "LOW"},
              "Invalid value 'LOW' for '--level': must be one of low, high."),
        OnSet("bool_junk", {"-n", "x", "-e", "maybe"},
              "Invalid value 'maybe' for '--enabled': expected true or false (also yes/no, 1/0, on/off)."),
        OnSet("given_twice", {"-n", "x", "--name=y"}, "Parameter '--name' given more than once."),
        OnSet("flag_with_value", {"-n", "x", "--force=yes"}, "Parameter '--force' is a flag and takes no value."),
        OnSet("stray_argument", {"-n", "x", "extra"},
              "Unexpected argument 'extra' after command 'storage volume set'."),
        OnSet("control_characters_escaped", {"-n", "x", "-q", "1\n2"},
              "Invalid value '1\\n2' for '--depth': expected a 64-bit decimal integer."),
        Whole("format_param_without_equals", {"--format-param", "fields"},
              "Invalid --format-param 'fields': expected KEY=VALUE. See 'autocli --help'."),
        OnSet("state_after_path", {"-n", "x", "--state", "f"}, "Option '--state' must come before the command path."),
        Whole("state_twice", {"--state", "a", "--state=b", "storage", "volume", "set", "-n", "x"},
              "Option '--state' given more than once. See 'autocli --help'."),
        Whole("formatter_twice_before_path", {"--formatter", "json", "--formatter=json", "storage"},
              "Option '--formatter' given more than once. See 'autocli --help'."),
        Whole("formatter_before_and_after_path",
              {"--formatter", "json", "storage", "volume", "set", "-n", "x", "--formatter", "csv"},
              "Option '--formatter' given more than once. See 'autocli storage volume set --help'."),
        OnSet("formatter_twice_after_path", {"-n", "x", "--formatter", "csv", "--formatter", "csv"},
              "Option '--formatter' given more than once."),
        Whole("format_key_before_and_after_path",
              {"--format-param", "show-header=no", "storage", "volume", "set", "-n", "x",
               "--format-param=show-header=yes"},
              "Format parameter 'show-header' given more than once. See 'autocli storage volume set --help'."),
        OnSet("fields_twice", {"-n", "x", "--format-param", "fields=Name", "--format-param", "fields=Size"},
              "Format parameter 'fields' given more than once.")),
    [](const auto& info) { return std::string(info.param.name); });

TEST(Parser, HelpStopsAtThePathGivenSoFar)
{
    Tree tree;
    auto inv = ParseCommandLine(tree.root, {"storage", "volume", "-h", "set"});
    EXPECT_EQ(inv.action, Invocation::Action::Help);
    EXPECT_EQ(inv.path, (CommandPath{"storage", "volume"}));
    // A value that looks like an option is still a value.
    inv = tree.Parse({"-n", "--help"});
    ASSERT_EQ(inv.action, Invocation::Action::Run) << inv.error;
    EXPECT_EQ(inv.input->GetParameter("name"), "--help");
}

TEST(Parser, BoolSpellingsInAnyCase)
{
    const std::vector<std::pair<const char*, bool>> accepted{
        {"true", true}, {"TRUE", true}, {"yes", true},    {"Yes", true},    {"1", true},   {"on", true},
        {"ON", true},   {"oN", true},   {"false", false}, {"False", false}, {"no", false}, {"NO", false},
        {"0", false},   {"off", false}, {"OFF", false},   {"Off", false}};
    for (const auto& [text, value] : accepted) {
        EXPECT_EQ(ParseBool(text), value) << text;
        Tree tree;
        auto inv = tree.Parse({"-n", "x", "-e", text});
        ASSERT_EQ(inv.action, Invocation::Action::Run) << text << ": " << inv.error;
        EXPECT_EQ(inv.input->GetParameterBool("enabled"), value) << text;
    }
    for (const char* bad : {"", "o", "onn", "of", "offf", "2", "-1", "t", "y", " on", "on "}) {
        EXPECT_FALSE(ParseBool(bad)) << bad;
    }
}

TEST(Parser, Int64Boundaries)
{
    EXPECT_EQ(ParseInt64("9223372036854775807"), INT64_MAX);
    EXPECT_EQ(ParseInt64("+12"), 12);
    for (const char* bad : {"", "+", "-", "+-1", " 1", "1 ", "0x10", "1e3", "-9223372036854775809"}) {
        EXPECT_FALSE(ParseInt64(bad)) << bad;
    }
}

TEST(Help, CommandHelpShowsParametersExamplesAndFieldsOnce)
{
    Tree tree;
    tree.set->describe = [old = tree.set->describe](InputSpec& inputs, FakeCommand& self) {
        old(inputs, self);
        inputs.AddParameter(Param("mode", "m", ParameterType::String, false, Levels()));
        inputs.GetParameters().back()->SetDescription("Mode, one of %ENUM%.");
    };
    const auto help = CommandHelp({"storage", "volume", "set"}, *tree.set);
    const auto again = CommandHelp({"storage", "volume", "set"}, *tree.set);
    EXPECT_EQ(help, again);
    EXPECT_EQ(tree.set->GetExamples().size(), 1u);
    EXPECT_NE(help.find("Mode, one of low, high. (optional)"), std::string::npos) << help;
    EXPECT_NE(help.find("low: Little"), std::string::npos);
    EXPECT_NE(help.find("-n|--name <str>"), std::string::npos);
    EXPECT_NE(help.find("(required)"), std::string::npos);
    EXPECT_NE(help.find("autocli storage volume set -n vol1\n      Change vol1."), std::string::npos);
    EXPECT_NE(help.find("Result: a list of Volume"), std::string::npos);
}

TEST(Help, NamespaceHelpListsChildrenInRegistrationOrder)
{
    auto ns = Namespace::New();
    ns->SetDescription("Things.");
    auto zeta = Namespace::New();
    zeta->SetDescription("Last letter.");
    ns->RegisterNamespaceNode(FakeCommand::New("Run b."), "b");
    ns->RegisterNamespaceNode(zeta, "zeta");
    ns->RegisterNamespaceNode(FakeCommand::New("Run a."), "a");
    EXPECT_EQ(NamespaceHelp({"x"}, *ns),
              "Usage: autocli [GLOBAL OPTIONS] x {NAMESPACE|COMMAND} ... [PARAMETERS]\n\nThings.\n\n"
              "Available commands and namespaces:\n  b         Run b.\n  zeta ...  Last letter.\n  a         Run a.\n");
}

} // namespace
