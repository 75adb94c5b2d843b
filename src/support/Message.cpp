#include "support/Message.h"

#include <algorithm>
#include <type_traits>

namespace glimmet {

const Message::Field* Message::FieldNamed(const std::string& name) const
{
    for (const Field& field : fields_) {
        if (field.name == name)
            return &field;
    }
    return nullptr;
}

bool Message::HasField(const std::string& name) const
{
    return FieldNamed(name) != nullptr;
}

int32_t Message::CountValues(const std::string& name) const
{
    const Field* field = FieldNamed(name);
    return field == nullptr ? 0 : int32_t(field->values.size());
}

void Message::RemoveField(const std::string& name)
{
    std::erase_if(fields_, [&](const Field& field) { return field.name == name; });
}

status_t Message::GetInfo(int32_t index, std::string* name, FieldType* type, int32_t* count) const
{
    // FieldType numbers the value kinds in the order Value lists them.
    static_assert(std::is_same_v<std::variant_alternative_t<size_t(FieldType::kInt32), Value>, int32_t>);
    static_assert(std::is_same_v<std::variant_alternative_t<size_t(FieldType::kPointer), Value>, void*>);
    static_assert(std::is_same_v<std::variant_alternative_t<size_t(FieldType::kPath), Value>, std::filesystem::path>);
    if (index < 0 || size_t(index) >= fields_.size())
        return B_BAD_INDEX;
    const Field& field = fields_[size_t(index)];
    if (name != nullptr)
        *name = field.name;
    if (type != nullptr)
        *type = FieldType(field.values.front().index());
    if (count != nullptr)
        *count = int32_t(field.values.size());
    return B_OK;
}

status_t Message::GetInfo(const std::string& name, FieldType* type, int32_t* count) const
{
    const Field* field = FieldNamed(name);
    if (field == nullptr)
        return B_NAME_NOT_FOUND;
    if (type != nullptr)
        *type = FieldType(field->values.front().index());
    if (count != nullptr)
        *count = int32_t(field->values.size());
    return B_OK;
}

status_t Message::CopyValue(const Message& from, const std::string& name, int32_t index)
{
    const Field* field = from.FieldNamed(name);
    if (field == nullptr)
        return B_NAME_NOT_FOUND;
    if (index < 0 || size_t(index) >= field->values.size())
        return B_BAD_INDEX;
    // Copied first: from may be this very message, whose fields may move.
    const Value value = field->values[size_t(index)];
    return AddValue(name, value);
}

status_t Message::AddValue(const std::string& name, const Value& value)
{
    for (Field& field : fields_) {
        if (field.name == name) {
            if (field.values.front().index() != value.index())
                return B_BAD_TYPE;
            field.values.push_back(value);
            return B_OK;
        }
    }
    fields_.push_back(Field{name, {value}});
    return B_OK;
}

}  // namespace glimmet
