// A command's declarations as text lines, so that a metadata test compares one table of
// golden lines per command instead of walking the framework's objects field by field.
#pragma once

#include <memory>
#include <string>
#include <vector>

#include "autocli/AutoCli.h"

namespace MeskTest {

// The result template in short: "bool", "Name{field:kind,...}" or "list of Name{...}". A
// template whose scalars already carry a value is marked with "=set".
inline std::string DescribeShape(const std::shared_ptr<Kalmor::MetaObj::MetaObject>& object) {
    using namespace Kalmor::MetaObj;
    if (auto flag = std::dynamic_pointer_cast<MetaBool>(object)) {
        return flag->HasValue() ? "bool=set" : "bool";
    }
    if (auto number = std::dynamic_pointer_cast<MetaInt>(object)) {
        return number->HasValue() ? "int=set" : "int";
    }
    if (auto text = std::dynamic_pointer_cast<MetaString>(object)) {
        return text->HasValue() ? "text=set" : "text";
    }
    if (auto list = std::dynamic_pointer_cast<MetaList>(object)) {
        return "list of " + DescribeShape(list->GetTemplate());
    }
    auto structure = std::dynamic_pointer_cast<MetaStruct>(object);
    if (!structure) return "?";
    std::string description = structure->GetName() + "{";
    for (const auto& field : structure->GetFields()) {
        description += field.name + ":" + DescribeShape(field.value) + ",";
    }
    return description + "}";
}

// "--name -s kind required|optional [constraint]: help", the help up to its first newline.
inline std::string DescribeParameter(const Kalmor::CallSpec::ParameterSpec& parameter) {
    using namespace Kalmor::CallSpec;
    static const char* const kinds[] = {"text", "int", "bool", "flag", "list"};
    std::string description = "--" + parameter.GetName() + " -" + parameter.GetShortName() + " " +
                              kinds[parameter.GetType()] +
                              (parameter.IsRequired() ? " required" : " optional");
    if (const auto& constraint = parameter.GetConstraint()) {
        if (constraint->GetType() == CONSTRAINT_INT_RANGE) {
            description += " range " + std::to_string(constraint->GetIntMinimum()) + ".." +
                           std::to_string(constraint->GetIntMaximum());
        } else {
            description += " enum";
            for (const auto& value : constraint->GetStringEnum()) {
                description += " " + value.value + "=" + value.description;
            }
        }
    }
    const std::string& help = parameter.GetDescription();
    return description + ": " + help.substr(0, help.find('\n'));
}

// Description, metadata fields, formatter, output parameters, parameters, result template.
inline std::vector<std::string> DescribeCommand(Kalmor::AutoCli::Command& command) {
    std::vector<std::string> lines = {command.GetDescription()};
    for (const auto& [key, value] : command.GetMetaData()) lines.push_back(key + "=" + value);
    lines.push_back("formatter=" + command.GetDefaultOutputFormatter());
    for (const auto& [key, value] : command.GetDefaultOutputParameters()) {
        lines.push_back(key + "=" + value);
    }
    const auto input = command.GetInputSpecInternal();
    for (const auto& parameter : input->GetParameters()) {
        lines.push_back(DescribeParameter(*parameter));
    }
    lines.push_back(DescribeShape(command.GetOutputSpecInternal()->GetRootObject()));
    return lines;
}

}  // namespace MeskTest
