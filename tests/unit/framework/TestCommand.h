// A command whose parameters, result template and behaviour a test sets.
#pragma once

#include <functional>
#include <memory>
#include <string>
#include <vector>

#include "autocli/AutoCli.h"

namespace FrameworkTest {

namespace CallSpec = Kalmor::CallSpec;

class TestCommand : public virtual Kalmor::AutoCli::Command {
  public:
    using Body = std::function<void(CallSpec::Input&, CallSpec::Output&)>;

    static std::shared_ptr<TestCommand> New(const std::string& description, Body body = nullptr) {
        auto command = std::make_shared<TestCommand>();
        command->SetDescription(description);
        command->body_ = std::move(body);
        return command;
    }

    std::shared_ptr<CallSpec::InputSpec> GetInputSpecInternal() override { return inputSpec_; }
    std::shared_ptr<CallSpec::OutputSpec> GetOutputSpecInternal() override {
        auto spec = CallSpec::OutputSpec::New();
        spec->SetRootObject(template_);
        return spec;
    }
    void ExecuteInternal(std::shared_ptr<CallSpec::Input> input,
                         std::shared_ptr<CallSpec::Output> output) override {
        ++runs;
        if (body_) body_(*input, *output);
    }

    std::shared_ptr<CallSpec::InputSpec> inputSpec_ = CallSpec::InputSpec::New();
    std::shared_ptr<Kalmor::MetaObj::MetaObject> template_;
    int runs = 0;

  private:
    Body body_;
};

inline std::shared_ptr<CallSpec::ParameterConstraint> Enum(
    std::initializer_list<const char*> values) {
    auto constraint = CallSpec::ParameterConstraint::New(CallSpec::CONSTRAINT_STRING_ENUM);
    for (const char* value : values) constraint->AddStringEnum(value, "");
    return constraint;
}

inline std::shared_ptr<CallSpec::ParameterConstraint> Range(int64_t minimum, int64_t maximum) {
    auto constraint = CallSpec::ParameterConstraint::New(CallSpec::CONSTRAINT_INT_RANGE);
    constraint->SetIntRange(minimum, maximum);
    return constraint;
}

// A parameter in one expression: Param("count", PARAM_INT, "c", true, "How many.", Range(0, 9)).
inline std::shared_ptr<CallSpec::ParameterSpec> Param(
    const std::string& name, CallSpec::ParameterType type, const std::string& shortName = "",
    bool required = false, const std::string& description = "",
    std::shared_ptr<CallSpec::ParameterConstraint> constraint = nullptr) {
    auto parameter = CallSpec::ParameterSpec::New(name, type);
    parameter->SetShortName(shortName);
    parameter->SetRequired(required);
    parameter->SetDescription(description);
    parameter->SetConstraint(constraint);
    return parameter;
}

// One parameter of every kind; --name is required, --count 0 to 512, --role witness or node.
inline std::shared_ptr<CallSpec::InputSpec> EveryKind() {
    auto spec = CallSpec::InputSpec::New();
    spec->AddParameter(Param("name", CallSpec::PARAM_STRING, "n", true));
    spec->AddParameter(Param("count", CallSpec::PARAM_INT, "c", false, "", Range(0, 512)));
    spec->AddParameter(Param("big", CallSpec::PARAM_INT));
    spec->AddParameter(Param("loud", CallSpec::PARAM_BOOL, "l"));
    spec->AddParameter(Param("wave", CallSpec::PARAM_FLAG, "w"));
    spec->AddParameter(Param("item", CallSpec::PARAM_STRING_LIST, "i"));
    spec->AddParameter(
        Param("role", CallSpec::PARAM_STRING, "r", false, "", Enum({"witness", "node"})));
    return spec;
}

// The words of a command line split at each space: "mesk " is "mesk" and an empty word.
inline std::vector<std::string> Words(const std::string& line) {
    std::vector<std::string> words;
    size_t start = 0;
    for (size_t end; (end = line.find(' ', start)) != std::string::npos; start = end + 1) {
        words.push_back(line.substr(start, end - start));
    }
    words.push_back(line.substr(start));
    return words;
}

}  // namespace FrameworkTest
