#pragma once

// The base of every storage command: what a command declares about itself (description,
// default formatter, examples, parameters, result) is given once to the constructor; the
// command itself only runs.

#include <memory>
#include <string>
#include <utility>
#include <vector>

#include "command/Columns.h"
#include "command/Command.h"

namespace OrvaneCli::FileSystem {

struct Example {
    const char* arguments;
    const char* description;
};

// What a command's result is: true on success, or rows (or one structure) of a column table.
struct ResultDecl {
    enum Kind { Boolean, List, Single };
    Kind kind = Boolean;
    const ColumnTable* table = nullptr;
};
inline ResultDecl ListOf(const ColumnTable& table) { return {ResultDecl::List, &table}; }
inline ResultDecl One(const ColumnTable& table) { return {ResultDecl::Single, &table}; }

struct CommandDecl {
    std::string description;
    ResultDecl result = {};
    const char* formatter = nullptr; // the default formatter, if any
    std::vector<Example> examples = {};
    std::vector<ParameterDecl> parameters = {}; // in the order help shows them
};

// A leaf command inherits this constructor and adds its Run; its declaration is handed over
// where the area's factory makes it.
class StorageCommand : public Command {
public:
    explicit StorageCommand(CommandDecl decl);

protected:
    virtual void Run(const InputPtr& in, const OutputPtr& out) = 0;

    // The shape of the result's rows as the switches are now.
    RowShape Rows() const { return decl_.result.table->Shape(); }

private:
    std::shared_ptr<InputSpec> GetInputSpecInternal() final;
    std::shared_ptr<OutputSpec> GetOutputSpecInternal() final;
    void ExecuteInternal(const InputPtr& in, const OutputPtr& out) final;

    CommandDecl decl_;
};

// A command that makes one StorageInfoImpl call, its Act, and is true when it returns.
class HostActionCommand : public StorageCommand {
public:
    HostActionCommand(const char* description, StorageInfoPlacement placement);

protected:
    virtual void Act(StorageInfoImpl& storage) = 0;

private:
    void Run(const InputPtr& in, const OutputPtr& out) final;

    StorageInfoPlacement placement_;
};

// A report on the one HLFS volume named by -l/-u, in one structure of `columns` whose fields
// Fill sets. No volume or a host failure leaves no result.
class HlfsVolumeReport : public StorageCommand {
public:
    HlfsVolumeReport(const char* description, const ColumnTable& columns);

protected:
    virtual void Fill(HlFileSystem& volume, Row& row) = 0;

private:
    void Run(const InputPtr& in, const OutputPtr& out) final;
};

// Makes a command for the tree.
template <typename Leaf, typename... Args>
std::shared_ptr<Command> New(Args&&... args)
{
    return std::make_shared<Leaf>(std::forward<Args>(args)...);
}

} // namespace OrvaneCli::FileSystem
