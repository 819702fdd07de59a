// Reading the parsed arguments: what a command declared reads as its value or as empty,
// anything else is a fault in the command and must fail loudly.

#include <functional>
#include <ostream>

#include <gtest/gtest.h>

#include "FakeCommand.h"
#include "quillets/QuilletException.h"

using namespace FrameworkTest;
using Quillets::QuilletException;

namespace {

std::shared_ptr<InputSpec> OneOfEachKind()
{
    auto inputs = InputSpec::New();
    inputs->AddParameter(Param("name", "n", ParameterType::String));
    inputs->AddParameter(Param("depth", "q", ParameterType::Int));
    inputs->AddParameter(Param("enabled", "e", ParameterType::Bool));
    inputs->AddParameter(Param("force", "f", ParameterType::Flag));
    inputs->AddParameter(Param("hosts", "H", ParameterType::StringList));
    return inputs;
}

struct ReadCase {
    const char* name;
    std::function<void(const Input&)> read;
    std::string error; // "" when the read is allowed
};

void PrintTo(const ReadCase& c, std::ostream* os) { *os << c.name; }

class Reading : public ::testing::TestWithParam<ReadCase> {};

TEST_P(Reading, DeclaredNamesOnlyAndAsDeclared)
{
    const auto& c = GetParam();
    auto in = Input::New();
    in->Declare(OneOfEachKind(), "storage volume set");
    if (c.error.empty()) {
        EXPECT_NO_THROW(c.read(*in));
        return;
    }
    try {
        c.read(*in);
        ADD_FAILURE() << "no exception";
    } catch (const QuilletException& e) {
        EXPECT_EQ(e.what(), c.error);
    }
}

std::vector<std::string> List(const Input& in, const std::string& name)
{
    std::vector<std::string> values{"stale"};
    in.GetParameterList(name, values);
    return values;
}

std::string Undeclared(const std::string& name)
{
    return "Command 'storage volume set' reads parameter '" + name + "', which it does not declare.";
}

INSTANTIATE_TEST_SUITE_P(
    EachReader, Reading,
    ::testing::Values(
        ReadCase{"string", [](const Input& in) { EXPECT_EQ(in.GetParameter("name"), ""); }, ""},
        ReadCase{"int", [](const Input& in) { EXPECT_EQ(in.GetParameterInt("depth"), 0); }, ""},
        ReadCase{"bool", [](const Input& in) { EXPECT_FALSE(in.GetParameterBool("enabled")); }, ""},
        ReadCase{"flag", [](const Input& in) { EXPECT_FALSE(in.IsFlagSet("force")); }, ""},
        ReadCase{"flag_as_bool", [](const Input& in) { EXPECT_FALSE(in.GetParameterBool("force")); }, ""},
        ReadCase{"list", [](const Input& in) { EXPECT_TRUE(List(in, "hosts").empty()); }, ""},
        ReadCase{"has_declared", [](const Input& in) { EXPECT_FALSE(in.HasParameter("depth")); }, ""},
        ReadCase{"misspelt_string", [](const Input& in) { in.GetParameter("nmae"); }, Undeclared("nmae")},
        ReadCase{"misspelt_int", [](const Input& in) { in.GetParameterInt("dpeth"); }, Undeclared("dpeth")},
        ReadCase{"misspelt_bool", [](const Input& in) { in.GetParameterBool("enable"); }, Undeclared("enable")},
        ReadCase{"misspelt_flag", [](const Input& in) { in.IsFlagSet("forced"); }, Undeclared("forced")},
        ReadCase{"misspelt_list", [](const Input& in) { List(in, "host"); }, Undeclared("host")},
        ReadCase{"has_undeclared", [](const Input& in) { in.HasParameter("Name"); }, Undeclared("Name")},
        ReadCase{"int_as_string", [](const Input& in) { in.GetParameter("depth"); },
                 "Command 'storage volume set' reads parameter 'depth' as a string, but declares it as an integer."},
        ReadCase{"string_as_int", [](const Input& in) { in.GetParameterInt("name"); },
                 "Command 'storage volume set' reads parameter 'name' as an integer, but declares it as a string."},
        ReadCase{"bool_as_flag", [](const Input& in) { in.IsFlagSet("enabled"); },
                 "Command 'storage volume set' reads parameter 'enabled' as a flag, but declares it as a boolean."},
        ReadCase{"list_as_string", [](const Input& in) { in.GetParameter("hosts"); },
                 "Command 'storage volume set' reads parameter 'hosts' as a string, but declares it as a string list."},
        ReadCase{"string_as_list", [](const Input& in) { List(in, "name"); },
                 "Command 'storage volume set' reads parameter 'name' as a string list, but declares it as a string."}),
    [](const auto& info) { return std::string(info.param.name); });

TEST(Reading, NeedsADeclaration) { EXPECT_THROW(Input::New()->Declare(nullptr, "cmd"), QuilletException); }

} // namespace
