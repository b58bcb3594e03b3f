// A command whose parameters, result template and behaviour a test sets.
#pragma once

#include <functional>
#include <memory>
#include <string>

#include "autocli/AutoCli.h"

namespace FrameworkTest {

class TestCommand : public virtual Kalmor::AutoCli::Command {
  public:
    using Body = std::function<void(Kalmor::CallSpec::Input&, Kalmor::CallSpec::Output&)>;

    static std::shared_ptr<TestCommand> New(const std::string& description, Body body = nullptr) {
        auto command = std::make_shared<TestCommand>();
        command->SetDescription(description);
        command->body_ = std::move(body);
        return command;
    }

    std::shared_ptr<Kalmor::CallSpec::InputSpec> GetInputSpecInternal() override {
        return inputSpec_;
    }
    std::shared_ptr<Kalmor::CallSpec::OutputSpec> GetOutputSpecInternal() override {
        auto spec = Kalmor::CallSpec::OutputSpec::New();
        spec->SetRootObject(template_);
        return spec;
    }
    void ExecuteInternal(std::shared_ptr<Kalmor::CallSpec::Input> input,
                         std::shared_ptr<Kalmor::CallSpec::Output> output) override {
        ++runs;
        lastInput = input;
        if (body_) {
            body_(*input, *output);
        }
    }

    std::shared_ptr<Kalmor::CallSpec::InputSpec> inputSpec_ = Kalmor::CallSpec::InputSpec::New();
    std::shared_ptr<Kalmor::MetaObj::MetaObject> template_;
    int runs = 0;
    std::shared_ptr<Kalmor::CallSpec::Input> lastInput;

  private:
    Body body_;
};

// A parameter in one expression: Param("count", PARAM_INT, "c", true, "How many.").
inline std::shared_ptr<Kalmor::CallSpec::ParameterSpec> Param(const std::string& name,
                                                              Kalmor::CallSpec::ParameterType type,
                                                              const std::string& shortName = "",
                                                              bool required = false,
                                                              const std::string& description = "") {
    auto parameter = Kalmor::CallSpec::ParameterSpec::New(name, type);
    parameter->SetShortName(shortName);
    parameter->SetRequired(required);
    parameter->SetDescription(description);
    return parameter;
}

inline std::shared_ptr<Kalmor::CallSpec::ParameterConstraint> Enum(
    std::initializer_list<const char*> values) {
    auto constraint =
        Kalmor::CallSpec::ParameterConstraint::New(Kalmor::CallSpec::CONSTRAINT_STRING_ENUM);
    for (const char* value : values) {
        constraint->AddStringEnum(value, "");
    }
    return constraint;
}

inline std::shared_ptr<Kalmor::CallSpec::ParameterConstraint> Range(int64_t minimum,
                                                                    int64_t maximum) {
    auto constraint =
        Kalmor::CallSpec::ParameterConstraint::New(Kalmor::CallSpec::CONSTRAINT_INT_RANGE);
    constraint->SetIntRange(minimum, maximum);
    return constraint;
}

}  // namespace FrameworkTest
