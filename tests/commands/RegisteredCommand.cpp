#include "RegisteredCommand.h"

#include <sstream>

#include <gtest/gtest.h>

#include "registration/Registration.h"

namespace TestSupport {

std::shared_ptr<Quillets::AutoCli::Command> RegisteredCommand(const std::string& path)
{
    auto root = Quillets::AutoCli::Namespace::New();
    root->SetName("root");
    auto storage = Quillets::AutoCli::Namespace::New();
    root->RegisterNamespaceNode(storage, "storage");
    FilesystemNfs_RegisterNamespaces(storage);
    AutoCli_RegisterNamespaces(root);

    std::shared_ptr<Quillets::AutoCli::NamespaceNode> node = root;
    std::istringstream names(path);
    for (std::string name; names >> name;) {
        if (!node->HasNamespaceNode(name)) {
            ADD_FAILURE() << "no '" << name << "' in the path '" << path << "'";
            return nullptr;
        }
        node = node->GetNamespaceNode(name);
    }
    auto command = std::dynamic_pointer_cast<Quillets::AutoCli::Command>(node);
    EXPECT_TRUE(command) << path << " is not a command";
    return command;
}

} // namespace TestSupport
