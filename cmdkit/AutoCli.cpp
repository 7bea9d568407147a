// The command tree: namespace nodes, command descriptions and commands.
#include "cmdkit/AutoCli.h"

#include <algorithm>

namespace CmdKit::AutoCli {

NamespaceNode::~NamespaceNode() = default;

std::shared_ptr<NamespaceNode> NamespaceNode::GetThis() {
    auto self = self_.lock();
    if (!self) {
        throw CmdKitException("Node " + GetPathString(' ') +
                              " was not made by New() and has no shared owner");
    }
    return self;
}

bool NamespaceNode::HasNamespaceNode(const std::string& name) const {
    return GetNamespaceNode(name) != nullptr;
}

std::shared_ptr<NamespaceNode> NamespaceNode::GetNamespaceNode(const std::string& name) const {
    for (const auto& [word, node] : children_) {
        if (word == name) return node;
    }
    return nullptr;
}

void NamespaceNode::RegisterNamespaceNode(std::shared_ptr<NamespaceNode> node,
                                          const std::string& name) {
    if (!node) throw CmdKitException("Cannot register a null node as " + name);
    if (name.empty()) throw CmdKitException("Cannot register a node without a name");
    if (node.get() == this) throw CmdKitException("Cannot register a node under itself");
    node->SetParent(this, name);
    for (auto& [word, child] : children_) {
        if (word == name) {
            child = std::move(node);
            return;
        }
    }
    children_.emplace_back(name, std::move(node));
}

std::shared_ptr<NamespaceNode> NamespaceNode::ResolveNode(const std::vector<std::string>& words,
                                                          size_t& consumed) {
    consumed = 0;
    std::shared_ptr<NamespaceNode> node = GetThis();
    while (consumed < words.size()) {
        auto child = node->GetNamespaceNode(words[consumed]);
        if (!child) break;
        node = std::move(child);
        ++consumed;
    }
    return node;
}

void NamespaceNode::SetParent(NamespaceNode* parent, const std::string& name) {
    parent_ = parent;
    name_ = name;
}

std::vector<std::string> NamespaceNode::GetPath() const {
    std::vector<std::string> path;
    for (const NamespaceNode* node = this; node && node->GetParent(); node = node->GetParent()) {
        path.push_back(node->GetName());
    }
    std::reverse(path.begin(), path.end());
    return path;
}

std::string NamespaceNode::GetPathString(char separator) const {
    std::string text;
    for (const auto& word : GetPath()) {
        if (!text.empty()) text += separator;
        text += word;
    }
    return text;
}

std::vector<std::string> NamespaceNode::GetNamespaceNodeNames() const {
    std::vector<std::string> names;
    names.reserve(children_.size());
    for (const auto& child : children_) names.push_back(child.first);
    return names;
}

std::vector<std::shared_ptr<NamespaceNode>> NamespaceNode::GetNamespaceNodes() const {
    std::vector<std::shared_ptr<NamespaceNode>> nodes;
    nodes.reserve(children_.size());
    for (const auto& child : children_) nodes.push_back(child.second);
    return nodes;
}

std::shared_ptr<NamespaceNode> NamespaceNode::SubNamespace(const std::string& name) {
    if (auto existing = GetNamespaceNode(name)) return existing;
    auto node = Namespace::New();
    RegisterNamespaceNode(node, name);
    return node;
}

std::shared_ptr<Namespace> Namespace::New() {
    return AdoptSelf(std::shared_ptr<Namespace>(new Namespace));
}

void CommandSpec::SetDefaultOutputParameter(const std::string& key, const std::string& value) {
    hints_[key] = value;
}

void CommandSpec::SetMetaDataField(const std::string& key, const std::string& value) {
    metadata_[key] = value;
}

std::string CommandSpec::GetMetaDataField(const std::string& key) const {
    auto found = metadata_.find(key);
    return found == metadata_.end() ? std::string() : found->second;
}

std::shared_ptr<CallSpec::InputSpec> CommandSpec::GetInputSpec() {
    if (!input_) {
        input_ = GetInputSpecInternal();
        if (!input_) input_ = CallSpec::InputSpec::New();
    }
    return input_;
}

std::shared_ptr<CallSpec::OutputSpec> CommandSpec::GetOutputSpec() {
    if (!output_) {
        output_ = GetOutputSpecInternal();
        if (!output_) output_ = CallSpec::OutputSpec::New();
    }
    return output_;
}

void Command::Execute(std::shared_ptr<CallSpec::Input> input,
                      std::shared_ptr<CallSpec::Output> output) {
    if (!input || !output) throw CmdKitException("A command needs an input and an output");
    ExecuteInternal(std::move(input), std::move(output));
}

}  // namespace CmdKit::AutoCli
