// The plug-in's entry points: where the tree's namespaces go, in which order, and what
// registration does with a tree that is not as it expects.

#include <functional>
#include <map>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include "quillets/QuilletException.h"
#include "registration/Registration.h"
#include "support/HostFixture.h"

using Quillets::AutoCli::Namespace;
using Quillets::AutoCli::NamespaceNode;

namespace {

using NodePtr = std::shared_ptr<NamespaceNode>;

std::vector<std::string> ChildNames(const NodePtr& node)
{
    std::vector<std::string> names;
    for (const auto& [name, child] : node->GetChildren()) {
        names.push_back(name);
    }
    return names;
}

// Every path below `node`, depth first in registration order.
std::vector<std::string> Paths(const NodePtr& node, const std::string& prefix = "")
{
    std::vector<std::string> paths;
    for (const auto& [name, child] : node->GetChildren()) {
        const std::string path = prefix.empty() ? name : prefix + " " + name;
        paths.push_back(path);
        for (const auto& below : Paths(child, path)) {
            paths.push_back(below);
        }
    }
    return paths;
}

NodePtr Child(const NodePtr& node, const std::string& path)
{
    NodePtr current = node;
    std::size_t start = 0;
    while (start <= path.size()) {
        const auto end = path.find(' ', start);
        const std::string name = path.substr(start, end == std::string::npos ? std::string::npos : end - start);
        if (!current->HasNamespaceNode(name)) {
            return nullptr;
        }
        current = current->GetNamespaceNode(name);
        if (end == std::string::npos) {
            break;
        }
        start = end + 1;
    }
    return current;
}

// A namespace that records, for each child attached to it, the child's subtree at that moment.
class RecordingNamespace : public Namespace {
public:
    void RegisterNamespaceNode(NodePtr node, const char* name) override
    {
        attachedSubtrees[name] = Paths(node);
        Namespace::RegisterNamespaceNode(std::move(node), name);
    }
    std::map<std::string, std::vector<std::string>> attachedSubtrees;
};

NodePtr RootWithStorage()
{
    auto root = Namespace::New();
    root->SetName("root");
    auto storage = Namespace::New();
    storage->SetName("storage");
    root->RegisterNamespaceNode(storage, "storage");
    return root;
}

class RegistrationTest : public ::testing::Test {
protected:
    TestSupport::ScopedHost host_{R"({"features": {"102": true, "103": true, "104": true, "270": true}})"};
};

TEST_F(RegistrationTest, RootWithoutStorageIsRefusedWithTheRootsName)
{
    for (const std::string rootName : {"root", "cli"}) {
        auto root = Namespace::New();
        root->SetName(rootName);
        root->RegisterNamespaceNode(Namespace::New(), "network");
        try {
            AutoCli_RegisterNamespaces(root);
            FAIL() << "no exception";
        } catch (const Quillets::QuilletException& e) {
            EXPECT_EQ(std::string(e.what()), "Unable to find 'storage' namespace in namespace '" + rootName + "'");
        }
        EXPECT_EQ(ChildNames(root), std::vector<std::string>{"network"});
    }
}

TEST_F(RegistrationTest, NodesThatAreNotNamespacesAreRefused)
{
    // A `storage` that is a command, and an `internal` that is one.
    auto commandRoot = Namespace::New();
    commandRoot->SetName("root");
    auto rescan = RootWithStorage();
    FilesystemNfs_RegisterNamespaces(Child(rescan, "storage"));
    commandRoot->RegisterNamespaceNode(Child(rescan, "storage filesystem rescan"), "storage");
    EXPECT_THROW(AutoCli_RegisterNamespaces(commandRoot), Quillets::QuilletException);

    auto root = RootWithStorage();
    Child(root, "storage")->RegisterNamespaceNode(Child(rescan, "storage filesystem automount"), "internal");
    try {
        AutoCli_RegisterNamespaces(root);
        FAIL() << "no exception";
    } catch (const Quillets::QuilletException& e) {
        EXPECT_EQ(std::string(e.what()), "Unable to find 'internal' namespace in namespace 'storage'");
    }
}

TEST_F(RegistrationTest, InternalNamespaceIsCreatedOrReused)
{
    auto fresh = RootWithStorage();
    AutoCli_RegisterNamespaces(fresh);
    auto internal = Child(fresh, "storage internal");
    ASSERT_TRUE(internal);
    EXPECT_EQ(internal->GetDescription(), "Orvane internal storage commands.");
    EXPECT_EQ(ChildNames(internal), (std::vector<std::string>{"core", "nmp", "clusteredhdsk"}));
    EXPECT_TRUE(Child(fresh, "storage internal core")->GetChildren().empty());
    EXPECT_EQ(Child(fresh, "storage internal core")->GetDescription(),
              "Orvane core storage commands. No operations are currently internal only.");

    auto existing = RootWithStorage();
    auto mine = Namespace::New();
    mine->SetDescription("Internal commands of another component.");
    mine->RegisterNamespaceNode(Namespace::New(), "other");
    Child(existing, "storage")->RegisterNamespaceNode(mine, "internal");
    AutoCli_RegisterNamespaces(existing);
    EXPECT_EQ(Child(existing, "storage internal"), mine);
    EXPECT_EQ(mine->GetDescription(), "Internal commands of another component.");
    EXPECT_EQ(ChildNames(mine), (std::vector<std::string>{"other", "core", "nmp", "clusteredhdsk"}));
}

TEST_F(RegistrationTest, InternalIsAttachedBeforeItsChildren)
{
    auto storage = std::make_shared<RecordingNamespace>();
    auto recordingRoot = Namespace::New();
    recordingRoot->SetName("root");
    recordingRoot->RegisterNamespaceNode(storage, "storage");
    AutoCli_RegisterNamespaces(recordingRoot);
    EXPECT_TRUE(storage->attachedSubtrees.at("internal").empty());
}

TEST_F(RegistrationTest, PublicNamespacesAreAttachedCompleteAndInOrder)
{
    auto storage = std::make_shared<RecordingNamespace>();
    FilesystemNfs_RegisterNamespaces(storage);
    EXPECT_EQ(ChildNames(storage), (std::vector<std::string>{"filesystem", "nfs", "nfs41", "hlfs"}));
    for (const auto& [name, child] : storage->GetChildren()) {
        EXPECT_EQ(storage->attachedSubtrees.at(name), Paths(child)) << name << " grew after it was attached";
        EXPECT_FALSE(child->GetDescription().empty()) << name;
    }
}

TEST(RegistrationSwitchTest, PreunmountStateFollowsItsSwitch)
{
    for (const bool on : {true, false}) {
        TestSupport::ScopedHost host(on ? R"({"features": {"270": true}})" : R"({"features": {"270": false}})");
        auto storage = Namespace::New();
        FilesystemNfs_RegisterNamespaces(storage);
        const std::vector<std::string> expected =
            on ? std::vector<std::string>{"add", "remove", "list", "preunmountstate", "param", "firewall"}
               : std::vector<std::string>{"add", "remove", "list", "param", "firewall"};
        EXPECT_EQ(ChildNames(Child(storage, "nfs")), expected);
    }
}

} // namespace
