#include "support/Message.h"

#include <algorithm>

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

}  // namespace glimmet
