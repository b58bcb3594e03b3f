// The command tree: namespaces, command descriptions and runnable commands.
#include "autocli/AutoCli.h"

#include <algorithm>
#include <stdexcept>

namespace Kalmor {
namespace AutoCli {

NamespaceNode::NamespaceNode() = default;

NamespaceNode::~NamespaceNode() = default;

std::shared_ptr<NamespaceNode> NamespaceNode::GetThis() {
    return weak_from_this().lock();
}

std::vector<std::string> NamespaceNode::GetPath() const {
    // The root has no parent and no name; every other node contributes its name.
    std::vector<std::string> path;
    const NamespaceNode* current = this;
    std::shared_ptr<NamespaceNode> keepAlive;
    while (std::shared_ptr<NamespaceNode> parent = current->GetParent()) {
        path.push_back(current->GetName());
        keepAlive = std::move(parent);
        current = keepAlive.get();
    }
    std::reverse(path.begin(), path.end());
    return path;
}

std::string NamespaceNode::GetPathString(char separator) const {
    std::string text;
    for (const auto& name : GetPath()) {
        if (!text.empty()) {
            text += separator;
        }
        text += name;
    }
    return text;
}

bool NamespaceNode::HasNamespaceNode(const std::string& name) const {
    return GetNamespaceNode(name) != nullptr;
}

std::vector<std::string> NamespaceNode::GetNamespaceNodeNames() const {
    std::vector<std::string> names;
    names.reserve(children_.size());
    for (const auto& child : children_) {
        names.push_back(child.first);
    }
    return names;
}

std::vector<std::shared_ptr<NamespaceNode>> NamespaceNode::GetNamespaceNodes() const {
    std::vector<std::shared_ptr<NamespaceNode>> nodes;
    nodes.reserve(children_.size());
    for (const auto& child : children_) {
        nodes.push_back(child.second);
    }
    return nodes;
}

std::shared_ptr<NamespaceNode> NamespaceNode::GetNamespaceNode(const std::string& name) const {
    for (const auto& child : children_) {
        if (child.first == name) {
            return child.second;
        }
    }
    return nullptr;
}

void NamespaceNode::RegisterNamespaceNode(std::shared_ptr<NamespaceNode> node,
                                          const std::string& name) {
    if (!node) {
        throw std::invalid_argument("cannot register a null node under '" + name + "'");
    }
    if (name.empty()) {
        throw std::invalid_argument("cannot register a node under an empty name");
    }
    if (GetNamespaceNode(name)) {
        std::string where = GetPathString(' ');
        throw std::invalid_argument("'" + name + "' is already registered" +
                                    (where.empty() ? std::string() : " in '" + where + "'"));
    }
    node->name_ = name;
    node->SetParent(GetThis());
    children_.emplace_back(name, std::move(node));
}

std::shared_ptr<NamespaceNode> NamespaceNode::ResolveNode(
    const std::vector<std::string>& names) const {
    std::shared_ptr<NamespaceNode> node =
        std::const_pointer_cast<NamespaceNode>(weak_from_this().lock());
    if (names.empty()) {
        return node;
    }
    node = GetNamespaceNode(names.front());
    if (!node) {
        return nullptr;
    }
    return node->ResolveNode(std::vector<std::string>(names.begin() + 1, names.end()));
}

std::shared_ptr<NamespaceNode> NamespaceNode::SubNamespace(const std::string& name) {
    // An existing child is returned whatever its kind; the caller checks GetType when it
    // needs a namespace.
    if (auto existing = GetNamespaceNode(name)) {
        return existing;
    }
    std::shared_ptr<NamespaceNode> created = Namespace::New();
    RegisterNamespaceNode(created, name);
    return created;
}

std::shared_ptr<CallSpec::CallTarget> NamespaceNode::GetDispatcher() {
    return nullptr;
}

void NamespaceNode::SetParent(std::shared_ptr<NamespaceNode> parent) {
    parent_ = parent;
}

std::shared_ptr<NamespaceNode> NamespaceNode::GetParent() const {
    return parent_.lock();
}

void NamespaceNode::SetDescription(const std::string& description) {
    description_ = description;
}

Namespace::Namespace() = default;

Namespace::~Namespace() = default;

std::shared_ptr<Namespace> Namespace::New() {
    return std::shared_ptr<Namespace>(new Namespace());
}

NodeType Namespace::GetType() const {
    return NodeType::Namespace;
}

CommandSpec::CommandSpec() = default;

CommandSpec::~CommandSpec() = default;

std::shared_ptr<CallSpec::InputSpec> CommandSpec::GetInputSpec() {
    // A command without parameters may hand back nothing; the framework treats that as an
    // empty specification.
    auto spec = GetInputSpecInternal();
    return spec ? spec : CallSpec::InputSpec::New();
}

std::shared_ptr<CallSpec::OutputSpec> CommandSpec::GetOutputSpec() {
    auto spec = GetOutputSpecInternal();
    return spec ? spec : CallSpec::OutputSpec::New();
}

std::shared_ptr<NamespaceNode> CommandSpec::GetThis() {
    return NamespaceNode::GetThis();
}

bool CommandSpec::HasNamespaceNode(const std::string& /*name*/) const {
    return false;
}

std::shared_ptr<NamespaceNode> CommandSpec::GetNamespaceNode(const std::string& /*name*/) const {
    return nullptr;
}

void CommandSpec::RegisterNamespaceNode(std::shared_ptr<NamespaceNode> /*node*/,
                                        const std::string& name) {
    throw std::logic_error("cannot register '" + name + "' below the command '" +
                           GetPathString(' ') + "'");
}

std::shared_ptr<NamespaceNode> CommandSpec::ResolveNode(
    const std::vector<std::string>& names) const {
    if (!names.empty()) {
        return nullptr;
    }
    return std::const_pointer_cast<NamespaceNode>(weak_from_this().lock());
}

std::shared_ptr<CallSpec::CallTarget> CommandSpec::GetDispatcher() {
    return std::dynamic_pointer_cast<CallSpec::CallTarget>(GetThis());
}

void CommandSpec::SetParent(std::shared_ptr<NamespaceNode> parent) {
    NamespaceNode::SetParent(std::move(parent));
}

std::shared_ptr<NamespaceNode> CommandSpec::GetParent() const {
    return NamespaceNode::GetParent();
}

NodeType CommandSpec::GetType() const {
    return NodeType::Command;
}

void CommandSpec::SetMetaDataField(const std::string& key, const std::string& value) {
    for (auto& entry : metadata_) {
        if (entry.first == key) {
            entry.second = value;
            return;
        }
    }
    metadata_.emplace_back(key, value);
}

void CommandSpec::SetDefaultOutputFormatter(const std::string& name) {
    formatter_ = name;
}

void CommandSpec::SetDefaultOutputParameter(const std::string& key, const std::string& value) {
    for (auto& entry : outputParameters_) {
        if (entry.first == key) {
            entry.second = value;
            return;
        }
    }
    outputParameters_.emplace_back(key, value);
}

std::string CommandSpec::GetMetaDataField(const std::string& key) const {
    for (const auto& entry : metadata_) {
        if (entry.first == key) {
            return entry.second;
        }
    }
    return std::string();
}

Command::Command() = default;

Command::~Command() = default;

void Command::Execute(std::shared_ptr<CallSpec::Input> input,
                      std::shared_ptr<CallSpec::Output> output) {
    if (!input) {
        input = CallSpec::Input::New();
    }
    if (!output) {
        output = CallSpec::Output::New();
    }
    ExecuteInternal(std::move(input), std::move(output));
}

}  // namespace AutoCli
}  // namespace Kalmor
