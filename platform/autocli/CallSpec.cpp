// Parameter and result descriptions, and the input and output of one invocation.
#include "autocli/CallSpec.h"

#include <cerrno>
#include <cstdlib>

namespace Kalmor {
namespace CallSpec {

std::shared_ptr<ParameterConstraint> ParameterConstraint::New(ParameterConstraintType type) {
    auto constraint = std::make_shared<ParameterConstraint>();
    constraint->type_ = type;
    return constraint;
}

ParameterConstraint::~ParameterConstraint() = default;

void ParameterConstraint::AddStringEnum(const std::string& value, const std::string& description) {
    enumValues_.push_back(EnumValue{value, description});
}

void ParameterConstraint::SetIntRange(int64_t minimum, int64_t maximum) {
    minimum_ = minimum;
    maximum_ = maximum;
}

std::shared_ptr<ParameterSpec> ParameterSpec::New(const std::string& name, ParameterType type) {
    auto parameter = std::make_shared<ParameterSpec>();
    parameter->name_ = name;
    parameter->type_ = type;
    return parameter;
}

ParameterSpec::~ParameterSpec() = default;

void ParameterSpec::SetShortName(const std::string& shortName) {
    shortName_ = shortName;
}

void ParameterSpec::SetRequired(bool required) {
    required_ = required;
}

void ParameterSpec::SetDescription(const std::string& description) {
    description_ = description;
}

void ParameterSpec::SetConstraint(std::shared_ptr<ParameterConstraint> constraint) {
    constraint_ = std::move(constraint);
}

std::shared_ptr<InputSpec> InputSpec::New() {
    return std::make_shared<InputSpec>();
}

InputSpec::~InputSpec() = default;

void InputSpec::AddParameter(std::shared_ptr<ParameterSpec> parameter) {
    parameters_.push_back(std::move(parameter));
}

std::shared_ptr<ParameterSpec> InputSpec::FindParameter(const std::string& name) const {
    for (const auto& parameter : parameters_) {
        if (parameter && parameter->GetName() == name) {
            return parameter;
        }
    }
    return nullptr;
}

std::shared_ptr<OutputSpec> OutputSpec::New() {
    return std::make_shared<OutputSpec>();
}

OutputSpec::~OutputSpec() = default;

void OutputSpec::SetRootObject(std::shared_ptr<MetaObj::MetaObject> root) {
    root_ = std::move(root);
}

std::shared_ptr<Input> Input::New() {
    return std::make_shared<Input>();
}

Input::~Input() = default;

std::string Input::GetParameter(const std::string& name) const {
    auto found = values_.find(name);
    if (found == values_.end() || found->second.empty()) {
        return std::string();
    }
    return found->second.front();
}

int64_t Input::GetParameterInt(const std::string& name) const {
    std::string text = GetParameter(name);
    if (text.empty()) {
        return 0;
    }
    // The parser stores only checked decimal text; anything else reads as 0.
    errno = 0;
    char* end = nullptr;
    long long value = std::strtoll(text.c_str(), &end, 10);
    if (errno != 0 || *end != '\0') {
        return 0;
    }
    return static_cast<int64_t>(value);
}

bool Input::GetParameterBool(const std::string& name) const {
    std::string text = GetParameter(name);
    return text == "true" || text == "1";
}

void Input::GetParameterList(const std::string& name, std::vector<std::string>& values) const {
    auto found = values_.find(name);
    if (found == values_.end()) {
        values.clear();
        return;
    }
    values = found->second;
}

bool Input::HasParameter(const std::string& name) const {
    return values_.count(name) != 0;
}

bool Input::IsFlagSet(const std::string& name) const {
    return HasParameter(name);
}

void Input::SetParameter(const std::string& name, const std::string& value) {
    values_[name] = std::vector<std::string>{value};
}

void Input::SetParameterInt(const std::string& name, int64_t value) {
    SetParameter(name, std::to_string(value));
}

void Input::SetParameterBool(const std::string& name, bool value) {
    SetParameter(name, value ? "true" : "false");
}

void Input::AddParameterValue(const std::string& name, const std::string& value) {
    values_[name].push_back(value);
}

void Input::SetFlag(const std::string& name) {
    values_[name];
}

std::shared_ptr<Output> Output::New() {
    return std::make_shared<Output>();
}

Output::~Output() = default;

void Output::SetRootObject(std::shared_ptr<MetaObj::MetaObject> root) {
    root_ = std::move(root);
}

void Output::AddErrorMessage(const std::string& message) {
    errors_.push_back(message);
}

void Output::SetComplete() {
    complete_ = true;
}

CallTargetSpec::~CallTargetSpec() = default;

CallTarget::~CallTarget() = default;

}  // namespace CallSpec
}  // namespace Kalmor
