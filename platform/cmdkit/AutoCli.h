// The command tree: namespace nodes, command descriptions and commands.
#pragma once

#include <functional>
#include <map>
#include <memory>
#include <string>
#include <utility>
#include <vector>

#include "cmdkit/CallSpec.h"
#include "cmdkit/CmdKitException.h"
#include "cmdkit/MetaObj.h"

namespace CmdKit::AutoCli {

enum class NodeType { Namespace, Command };

class NamespaceNode {
  public:
    virtual ~NamespaceNode();

    void SetDescription(const std::string& description) { description_ = description; }
    const std::string& GetDescription() const { return description_; }

    // A further owner of this node; valid once the node was made by its New().
    virtual std::shared_ptr<NamespaceNode> GetThis();
    virtual bool HasNamespaceNode(const std::string& name) const;
    virtual std::shared_ptr<NamespaceNode> GetNamespaceNode(const std::string& name) const;
    // Attaches a child under `name`; a word registered again replaces the earlier child.
    virtual void RegisterNamespaceNode(std::shared_ptr<NamespaceNode> node,
                                       const std::string& name);
    // Follows `words` from this node as far as they name children; `consumed` receives how many.
    virtual std::shared_ptr<NamespaceNode> ResolveNode(const std::vector<std::string>& words,
                                                       size_t& consumed);
    virtual void SetParent(NamespaceNode* parent, const std::string& name);
    virtual NamespaceNode* GetParent() const { return parent_; }
    virtual NodeType GetType() const { return NodeType::Namespace; }
    virtual std::vector<std::string> GetPath() const;
    virtual std::string GetPathString(char separator) const;
    virtual std::vector<std::string> GetNamespaceNodeNames() const;
    virtual std::vector<std::shared_ptr<NamespaceNode>> GetNamespaceNodes() const;
    // The child namespace of that name, made and attached when missing.
    virtual std::shared_ptr<NamespaceNode> SubNamespace(const std::string& name);

    const std::string& GetName() const { return name_; }

  protected:
    NamespaceNode() = default;

    // Stores the weak self-reference that GetThis() hands out; every New() goes through this.
    template <class T>
    static std::shared_ptr<T> AdoptSelf(std::shared_ptr<T> node) {
        node->self_ = node;
        return node;
    }

  private:
    std::weak_ptr<NamespaceNode> self_;
    std::string description_;
    std::string name_;
    NamespaceNode* parent_ = nullptr;
    std::vector<std::pair<std::string, std::shared_ptr<NamespaceNode>>> children_;
};

class Namespace : public NamespaceNode {
  public:
    static std::shared_ptr<Namespace> New();

  protected:
    Namespace() = default;
};

class CommandSpec : public NamespaceNode {
  public:
    NodeType GetType() const override { return NodeType::Command; }

    void SetDefaultOutputFormatter(const std::string& name) { formatter_ = name; }
    void SetDefaultOutputParameter(const std::string& key, const std::string& value);
    void SetMetaDataField(const std::string& key, const std::string& value);

    // "simple" unless the command chose another.
    const std::string& GetDefaultOutputFormatter() const { return formatter_; }
    const std::map<std::string, std::string>& GetDefaultOutputParameters() const { return hints_; }
    std::string GetMetaDataField(const std::string& key) const;

    // Asked once and kept.
    virtual std::shared_ptr<CallSpec::InputSpec> GetInputSpec();
    virtual std::shared_ptr<CallSpec::OutputSpec> GetOutputSpec();

  protected:
    CommandSpec() = default;
    virtual std::shared_ptr<CallSpec::InputSpec> GetInputSpecInternal() = 0;
    virtual std::shared_ptr<CallSpec::OutputSpec> GetOutputSpecInternal() = 0;

  private:
    std::string formatter_ = "simple";
    std::map<std::string, std::string> hints_;
    std::map<std::string, std::string> metadata_;
    std::shared_ptr<CallSpec::InputSpec> input_;
    std::shared_ptr<CallSpec::OutputSpec> output_;
};

class Command : public CommandSpec {
  public:
    virtual void Execute(std::shared_ptr<CallSpec::Input> input,
                         std::shared_ptr<CallSpec::Output> output);
    // The object that runs this command; a command dispatches itself.
    virtual Command* GetDispatcher() { return this; }

  protected:
    Command() = default;
    virtual void ExecuteInternal(std::shared_ptr<CallSpec::Input> input,
                                 std::shared_ptr<CallSpec::Output> output) = 0;
};

// Runs a host command line on behalf of `user`, without a shell: the whitespace-separated
// words of the line are the program and its arguments. `output` receives what it printed
// (standard output and error). Zero when the program ran and exited with status 0.
int AutoCli_ShellCmdWithKvUsername(const std::string& commandLine, const std::string& user,
                                   std::string& output, const std::string& extra);

// The host side of AutoCli_ShellCmdWithKvUsername: runs argv and returns its exit status
// (non-zero, with a message in `output`, when it could not be started). The host library
// installs its own; the default runs argv[0] as given.
using HostCommandRunner = int (*)(const std::vector<std::string>& argv, const std::string& user,
                                  std::string& output);
void SetHostCommandRunner(HostCommandRunner runner);

// The one way a program is started: `program` runs with `argv`, standard input from /dev/null,
// standard output and error collected together into `output`, and no other descriptor of the
// caller. Returns its exit status, 128 + the signal that ended it, or, with a message in
// `output`, 127 when there is no such program and 126 when it cannot be run.
int RunProgram(const std::string& program, const std::vector<std::string>& argv,
               std::string& output);

// What every command's execution runs inside: the scope calls `execute` once. The host library
// installs one to give a command one consistent view of the host (and to read it without
// locking it once per call); the default just executes.
using ExecutionScope = void (*)(const std::function<void()>& execute);
void SetExecutionScope(ExecutionScope scope);

}  // namespace CmdKit::AutoCli
