#pragma once

#include <cstdint>
#include <filesystem>
#include <string>
#include <variant>
#include <vector>

#include "support/Status.h"

namespace glimmet {

/// A command: a four-character code and named, typed fields. Looking up a
/// field that is missing, or that holds another type, fails, so that a
/// handler can ignore a message that lacks what it needs.
class Message {
public:
    explicit Message(uint32_t what = 0) : what(what) {}

    /// The kinds of value a field can hold, as GetInfo reports them.
    enum class FieldType : uint32_t { kInt32, kInt64, kBool, kFloat, kPointer, kString, kPath };

    uint32_t what;

    status_t AddInt32(const std::string& name, int32_t value) { return Add(name, value); }
    status_t AddInt64(const std::string& name, int64_t value) { return Add(name, value); }
    status_t AddBool(const std::string& name, bool value) { return Add(name, value); }
    status_t AddFloat(const std::string& name, float value) { return Add(name, value); }
    status_t AddPointer(const std::string& name, const void* value) { return Add(name, const_cast<void*>(value)); }
    status_t AddString(const std::string& name, const std::string& value) { return Add(name, value); }
    status_t AddPath(const std::string& name, const std::filesystem::path& value) { return Add(name, value); }

    status_t FindInt32(const std::string& name, int32_t* value, int32_t index = 0) const { return Find(name, value, index); }
    status_t FindInt64(const std::string& name, int64_t* value, int32_t index = 0) const { return Find(name, value, index); }
    status_t FindBool(const std::string& name, bool* value, int32_t index = 0) const { return Find(name, value, index); }
    status_t FindFloat(const std::string& name, float* value, int32_t index = 0) const { return Find(name, value, index); }
    status_t FindPointer(const std::string& name, void** value, int32_t index = 0) const { return Find(name, value, index); }
    status_t FindString(const std::string& name, std::string* value, int32_t index = 0) const { return Find(name, value, index); }
    status_t FindPath(const std::string& name, std::filesystem::path* value, int32_t index = 0) const { return Find(name, value, index); }

    /// Typed pointer lookup; the caller names the type it expects.
    template <typename T>
    status_t FindPointer(const std::string& name, T** value, int32_t index = 0) const
    {
        void* raw = nullptr;
        status_t status = Find(name, &raw, index);
        if (status == B_OK)
            *value = static_cast<T*>(raw);
        return status;
    }

    bool HasField(const std::string& name) const;
    /// Number of values stored under name (0 when missing).
    int32_t CountValues(const std::string& name) const;
    bool IsEmpty() const { return fields_.empty(); }
    void RemoveField(const std::string& name);

    /// The name, type and number of values of the field at index, in the
    /// order fields were first added; B_BAD_INDEX past the last field. Any
    /// of the outputs may be null.
    status_t GetInfo(int32_t index, std::string* name, FieldType* type, int32_t* count) const;
    /// The type and number of values of the field called name, or
    /// B_NAME_NOT_FOUND.
    status_t GetInfo(const std::string& name, FieldType* type, int32_t* count) const;
    /// Appends value index of from's field name to this message's field of
    /// that name, so that fields can be copied without knowing their type.
    /// Fails as a Find on from or an Add here would (B_NAME_NOT_FOUND,
    /// B_BAD_INDEX, B_BAD_TYPE).
    status_t CopyValue(const Message& from, const std::string& name, int32_t index);

private:
    using Value = std::variant<int32_t, int64_t, bool, float, void*, std::string, std::filesystem::path>;
    struct Field {
        std::string name;
        std::vector<Value> values;
    };

    const Field* FieldNamed(const std::string& name) const;

    template <typename T>
    status_t Add(const std::string& name, T value);
    status_t AddValue(const std::string& name, const Value& value);

    template <typename T>
    status_t Find(const std::string& name, T* value, int32_t index) const;

    std::vector<Field> fields_;
};

template <typename T>
status_t Message::Add(const std::string& name, T value)
{
    for (Field& field : fields_) {
        if (field.name == name) {
            // One name holds values of one type only.
            if (!std::holds_alternative<T>(field.values.front()))
                return B_BAD_TYPE;
            field.values.emplace_back(std::move(value));
            return B_OK;
        }
    }
    fields_.push_back(Field{name, {Value(std::move(value))}});
    return B_OK;
}

template <typename T>
status_t Message::Find(const std::string& name, T* value, int32_t index) const
{
    const Field* field = FieldNamed(name);
    if (field == nullptr)
        return B_NAME_NOT_FOUND;
    if (!std::holds_alternative<T>(field->values.front()))
        return B_BAD_TYPE;
    if (index < 0 || size_t(index) >= field->values.size())
        return B_BAD_INDEX;
    if (value != nullptr)
        *value = std::get<T>(field->values[size_t(index)]);
    return B_OK;
}

}  // namespace glimmet
