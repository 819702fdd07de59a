#pragma once

// Helpers shared by the volume, HLFS selection and extent list tests.

#include <regex>
#include <string>
#include <utility>
#include <vector>

#include <gtest/gtest.h>
#include <nlohmann/json.hpp>

#include "command/Command.h"
#include "support/Cli.h"
#include "support/HostFixture.h"

namespace VolumeTests {

using namespace OrvaneCli::FileSystem;
using Pairs = std::vector<std::pair<std::string, std::string>>;
using Texts = std::vector<std::string>;

// Parameters by kind: string values, flags, and list values (one pair per repetition).
inline InputPtr MakeInput(const Pairs& strings, const Texts& flags = {}, const Pairs& lists = {})
{
    auto in = Input::New();
    for (const auto& [name, value] : strings) in->SetParameter(name, value);
    for (const auto& flag : flags) in->SetFlag(flag);
    for (const auto& [name, value] : lists) in->AddParameterListValue(name, value);
    return in;
}

inline bool IsTrue(const std::shared_ptr<Quillets::MetaObj::MetaObject>& root)
{
    auto value = std::dynamic_pointer_cast<MetaBool>(root);
    return value && value->GetValue();
}

// One text per row, the fields' values joined by "|"; {"<no list>"} without a list result.
inline Texts Rows(const std::shared_ptr<Quillets::MetaObj::MetaObject>& root, const Texts& fields)
{
    auto list = std::dynamic_pointer_cast<MetaList>(root);
    if (!list) return {"<no list>"};
    Texts rows;
    for (const auto& row : list->GetElements()) {
        std::string text;
        for (const auto& field : fields) {
            const auto value = row->GetField(field);
            text += text.empty() ? "" : "|";
            if (auto s = std::dynamic_pointer_cast<MetaString>(value)) text += s->GetValue();
            else if (auto i = std::dynamic_pointer_cast<MetaInt>(value)) text += std::to_string(i->GetValue());
            else if (auto b = std::dynamic_pointer_cast<MetaBool>(value)) text += b->GetValue() ? "true" : "false";
        }
        rows.push_back(text);
    }
    return rows;
}

// The journal in short: "Call target" per volume call, "Call" per storage-wide one, "notify Event:stdin" per script run.
inline Texts Trace(const TestSupport::ScopedHost& host)
{
    static const std::regex event(" -t (\\S+) ");
    Texts trace;
    for (const auto& line : host.Journal()) {
        const std::string call = line.value("call", ""), target = line.value("target", "");
        std::smatch m;
        if (call != "AutoCli_ShellCmd") {
            // Storage-wide calls are named without a target.
            trace.push_back(target.empty() || call.rfind("StorageInfoImpl.", 0) == 0 ? call : call + " " + target);
        } else if (const std::string command = line["args"][0]; std::regex_search(command, m, event)) {
            trace.push_back("notify " + m[1].str() + ":" + line["args"][1].get<std::string>());
        }
    }
    return trace;
}

inline std::string Fault(const std::string& call, const std::string& target, const std::string& message, int skip = 0)
{
    nlohmann::json fault = {{"call", call}, {"message", message}, {"skip", skip}};
    if (!target.empty()) fault["target"] = target;
    return fault.dump();
}

} // namespace VolumeTests
