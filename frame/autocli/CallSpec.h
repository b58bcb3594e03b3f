// What a command declares about its parameters and result, and what it receives and hands
// back when it runs.
#pragma once

#include <cstdint>
#include <map>
#include <memory>
#include <string>
#include <vector>

#include "Visibility.h"
#include "autocli/MetaObj.h"

namespace Kalmor {
namespace CallSpec {

// Kinds of parameters, with the Input accessor that reads each.
enum ParameterType {
    PARAM_STRING = 0,       // GetParameter
    PARAM_INT = 1,          // GetParameterInt (signed 64-bit)
    PARAM_BOOL = 2,         // GetParameterBool (the user gives true or false)
    PARAM_FLAG = 3,         // IsFlagSet (present or absent, no value)
    PARAM_STRING_LIST = 4,  // GetParameterList (the option may be repeated)
};

enum ParameterConstraintType {
    CONSTRAINT_NONE = 0,
    CONSTRAINT_INT_RANGE = 1,    // SetIntRange: both bounds are allowed values
    CONSTRAINT_INT_ENUM = 2,     // not used by any plug-in; refused by the framework
    CONSTRAINT_STRING_ENUM = 3,  // AddStringEnum, once per allowed value
};

class KALMOR_API ParameterConstraint {
  public:
    struct EnumValue {
        std::string value;
        std::string description;
    };

    static std::shared_ptr<ParameterConstraint> New(ParameterConstraintType type);
    virtual ~ParameterConstraint();

    void AddStringEnum(const std::string& value, const std::string& description);
    void SetIntRange(int64_t minimum, int64_t maximum);

    ParameterConstraintType GetType() const { return type_; }
    const std::vector<EnumValue>& GetStringEnum() const { return enumValues_; }
    int64_t GetIntMinimum() const { return minimum_; }
    int64_t GetIntMaximum() const { return maximum_; }

  private:
    ParameterConstraintType type_ = CONSTRAINT_NONE;
    std::vector<EnumValue> enumValues_;
    int64_t minimum_ = 0;
    int64_t maximum_ = 0;
};

class KALMOR_API ParameterSpec {
  public:
    static std::shared_ptr<ParameterSpec> New(const std::string& name, ParameterType type);
    virtual ~ParameterSpec();

    void SetShortName(const std::string& shortName);  // a single letter
    // A parameter is required unless the command calls SetRequired(false): an option that a
    // command forgot to mark can then not be left out unnoticed.
    void SetRequired(bool required);
    void SetDescription(const std::string& description);
    void SetConstraint(std::shared_ptr<ParameterConstraint> constraint);

    const std::string& GetName() const { return name_; }
    ParameterType GetType() const { return type_; }
    const std::string& GetShortName() const { return shortName_; }
    bool IsRequired() const { return required_; }
    const std::string& GetDescription() const { return description_; }
    // The constraint, or nullptr when the parameter has none.
    const std::shared_ptr<ParameterConstraint>& GetConstraint() const { return constraint_; }

  private:
    std::string name_;
    ParameterType type_ = PARAM_STRING;
    std::string shortName_;
    bool required_ = true;
    std::string description_;
    std::shared_ptr<ParameterConstraint> constraint_;
};

class KALMOR_API InputSpec {
  public:
    static std::shared_ptr<InputSpec> New();
    virtual ~InputSpec();

    void AddParameter(std::shared_ptr<ParameterSpec> parameter);
    const std::vector<std::shared_ptr<ParameterSpec>>& GetParameters() const { return parameters_; }
    // The parameter of that long name, or nullptr.
    std::shared_ptr<ParameterSpec> FindParameter(const std::string& name) const;

  private:
    std::vector<std::shared_ptr<ParameterSpec>> parameters_;
};

class KALMOR_API OutputSpec {
  public:
    static std::shared_ptr<OutputSpec> New();
    virtual ~OutputSpec();

    void SetRootObject(std::shared_ptr<MetaObj::MetaObject> root);
    const std::shared_ptr<MetaObj::MetaObject>& GetRootObject() const { return root_; }

  private:
    std::shared_ptr<MetaObj::MetaObject> root_;
};

// The parsed parameters of one invocation. Values are kept in text form: integers in
// decimal, booleans as "true" or "false", flags as present without value.
class KALMOR_API Input {
  public:
    static std::shared_ptr<Input> New();
    virtual ~Input();

    // Accessors used by commands. For a parameter that was not given, GetParameter returns
    // the empty text, GetParameterInt 0, GetParameterBool false, GetParameterList nothing.
    // GetParameter of a list parameter returns its first value.
    std::string GetParameter(const std::string& name) const;
    int64_t GetParameterInt(const std::string& name) const;
    // Returns true iff the value is "true" or "1".
    bool GetParameterBool(const std::string& name) const;
    // Replaces `values` with the parameter's values, in the order given.
    void GetParameterList(const std::string& name, std::vector<std::string>& values) const;
    // Returns true iff the parameter was given, with or without a value.
    bool HasParameter(const std::string& name) const;
    // Returns true iff the flag was given.
    bool IsFlagSet(const std::string& name) const;

    // Filling, used by the framework's parser and by tests. SetParameter replaces any
    // earlier value; AddParameterValue appends one value of a list parameter.
    void SetParameter(const std::string& name, const std::string& value);
    void SetParameterInt(const std::string& name, int64_t value);
    void SetParameterBool(const std::string& name, bool value);
    void AddParameterValue(const std::string& name, const std::string& value);
    void SetFlag(const std::string& name);

    const std::map<std::string, std::vector<std::string>>& GetValues() const { return values_; }

  private:
    std::map<std::string, std::vector<std::string>> values_;
};

// What one invocation hands back: a root object (optional), error messages, completion.
class KALMOR_API Output {
  public:
    static std::shared_ptr<Output> New();
    virtual ~Output();

    // Sets the result. The framework shows a result that is set, error messages or not.
    void SetRootObject(std::shared_ptr<MetaObj::MetaObject> root);
    // Adds a message for the user; an invocation with any message has failed (exit status 1).
    void AddErrorMessage(const std::string& message);
    // Marks the result as all that the command has to hand back.
    void SetComplete();

    // The result, or nullptr when none was set.
    const std::shared_ptr<MetaObj::MetaObject>& GetRootObject() const { return root_; }
    const std::vector<std::string>& GetErrorMessages() const { return errors_; }
    bool IsComplete() const { return complete_; }

  private:
    std::shared_ptr<MetaObj::MetaObject> root_;
    std::vector<std::string> errors_;
    bool complete_ = false;
};

// Something that describes its input and output.
class KALMOR_API CallTargetSpec {
  public:
    virtual ~CallTargetSpec();
    virtual std::shared_ptr<InputSpec> GetInputSpec() = 0;
    virtual std::shared_ptr<OutputSpec> GetOutputSpec() = 0;
};

// Something that can be run.
class KALMOR_API CallTarget {
  public:
    virtual ~CallTarget();
    virtual void Execute(std::shared_ptr<Input> input, std::shared_ptr<Output> output) = 0;
};

}  // namespace CallSpec
}  // namespace Kalmor
