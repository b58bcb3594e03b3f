// The framework's command tree: namespaces and commands, and what a command derives from.
#pragma once

#include <map>
#include <memory>
#include <string>
#include <utility>
#include <vector>

#include "Visibility.h"
#include "autocli/CallSpec.h"
#include "autocli/MetaObj.h"

namespace Kalmor {
namespace AutoCli {

enum class NodeType { Namespace, Command };

// A node of the command tree. Children are kept in registration order and known by the name
// under which they were registered.
class KALMOR_API NamespaceNode : public std::enable_shared_from_this<NamespaceNode> {
  public:
    virtual ~NamespaceNode();

    // A shared pointer to this node; valid once the node is owned by a shared pointer.
    virtual std::shared_ptr<NamespaceNode> GetThis();
    virtual NodeType GetType() const = 0;
    // The names from the root's child down to this node.
    virtual std::vector<std::string> GetPath() const;
    virtual std::string GetPathString(char separator) const;
    virtual bool HasNamespaceNode(const std::string& name) const;
    virtual std::vector<std::string> GetNamespaceNodeNames() const;
    virtual std::vector<std::shared_ptr<NamespaceNode>> GetNamespaceNodes() const;
    // The child of that name, or nullptr.
    virtual std::shared_ptr<NamespaceNode> GetNamespaceNode(const std::string& name) const;
    // Adds a child under that name and makes this node its parent. Throws
    // std::invalid_argument for a null node, an empty name or a name already taken.
    virtual void RegisterNamespaceNode(std::shared_ptr<NamespaceNode> node,
                                       const std::string& name);
    // Follows the names down from this node; nullptr when a name is not found.
    virtual std::shared_ptr<NamespaceNode> ResolveNode(const std::vector<std::string>& names) const;
    // The child namespace of that name, made and registered when missing.
    virtual std::shared_ptr<NamespaceNode> SubNamespace(const std::string& name);
    // The command to run at this node, or nullptr for a namespace.
    virtual std::shared_ptr<CallSpec::CallTarget> GetDispatcher();
    virtual void SetParent(std::shared_ptr<NamespaceNode> parent);
    virtual std::shared_ptr<NamespaceNode> GetParent() const;

    void SetDescription(const std::string& description);
    const std::string& GetDescription() const { return description_; }
    // The name under which the parent registered this node (empty for the root).
    const std::string& GetName() const { return name_; }

  protected:
    NamespaceNode();

  private:
    std::string description_;
    std::string name_;
    std::weak_ptr<NamespaceNode> parent_;
    std::vector<std::pair<std::string, std::shared_ptr<NamespaceNode>>> children_;
};

// A node that only holds children.
class KALMOR_API Namespace : public NamespaceNode {
  public:
    static std::shared_ptr<Namespace> New();
    ~Namespace() override;
    NodeType GetType() const override;

  protected:
    Namespace();
};

// A leaf of the tree that describes a command: its metadata, default output formatter and
// default output parameters, and its input and output specifications.
class KALMOR_API CommandSpec : public CallSpec::CallTargetSpec, public NamespaceNode {
  public:
    ~CommandSpec() override;

    std::shared_ptr<CallSpec::InputSpec> GetInputSpec() override;
    std::shared_ptr<CallSpec::OutputSpec> GetOutputSpec() override;
    std::shared_ptr<NamespaceNode> GetThis() override;
    bool HasNamespaceNode(const std::string& name) const override;
    std::shared_ptr<NamespaceNode> GetNamespaceNode(const std::string& name) const override;
    // A command has no children: throws std::logic_error.
    void RegisterNamespaceNode(std::shared_ptr<NamespaceNode> node,
                               const std::string& name) override;
    std::shared_ptr<NamespaceNode> ResolveNode(
        const std::vector<std::string>& names) const override;
    std::shared_ptr<CallSpec::CallTarget> GetDispatcher() override;
    void SetParent(std::shared_ptr<NamespaceNode> parent) override;
    std::shared_ptr<NamespaceNode> GetParent() const override;
    NodeType GetType() const override;
    virtual std::shared_ptr<CallSpec::InputSpec> GetInputSpecInternal() = 0;
    virtual std::shared_ptr<CallSpec::OutputSpec> GetOutputSpecInternal() = 0;

    void SetMetaDataField(const std::string& key, const std::string& value);
    void SetDefaultOutputFormatter(const std::string& name);
    void SetDefaultOutputParameter(const std::string& key, const std::string& value);

    // The value of a metadata field, or the empty text.
    std::string GetMetaDataField(const std::string& key) const;
    const std::vector<std::pair<std::string, std::string>>& GetMetaData() const {
        return metadata_;
    }
    const std::string& GetDefaultOutputFormatter() const { return formatter_; }
    const std::vector<std::pair<std::string, std::string>>& GetDefaultOutputParameters() const {
        return outputParameters_;
    }

  protected:
    CommandSpec();

  private:
    std::vector<std::pair<std::string, std::string>> metadata_;
    std::string formatter_;
    std::vector<std::pair<std::string, std::string>> outputParameters_;
};

// The base of every command class.
class KALMOR_API Command : public CommandSpec, public CallSpec::CallTarget {
  public:
    ~Command() override;

    // Runs the command: hands the input and output to ExecuteInternal.
    void Execute(std::shared_ptr<CallSpec::Input> input,
                 std::shared_ptr<CallSpec::Output> output) override;
    virtual void ExecuteInternal(std::shared_ptr<CallSpec::Input> input,
                                 std::shared_ptr<CallSpec::Output> output) = 0;

  protected:
    Command();
};

// Runs a command line through /bin/sh -c, feeding it `input` on standard input, and stores
// what it printed on standard output and standard error, interleaved, in `output`: nothing of
// it reaches the caller's own streams. At most the first 1 MiB is kept; the rest is read and
// dropped. Returns once the shell has exited, even when a process it started in the
// background still holds its output open (what that one prints later is lost). Returns the
// exit status, or -1 when the shell could not be run or waited for, or was killed by a signal.
KALMOR_API int AutoCli_ShellCmd(const std::string& command, std::string& output,
                                const std::string& input);

}  // namespace AutoCli
}  // namespace Kalmor

// The entry point that every plug-in library exports with C linkage. The framework calls it
// once after loading the library, with its handle of the root of the command tree.
using AutoCli_RegisterNamespacesFn = void (*)(std::shared_ptr<Kalmor::AutoCli::NamespaceNode>*);
