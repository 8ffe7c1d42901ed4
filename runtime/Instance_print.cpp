#include <cstdio>

#include "runtime/Instance.h"
#include "runtime/Instance_values.h"

// The readable dump of an instance: made as one text, so that dumps of several threads do not mix.

namespace cimple {

namespace {

void append_indent(String& text, int level)
{
    for (; level; --level)
        text.append("    ", 4);
}

void append_quoted(const String& value, String& text)
{
    text.append('"');
    for (std::size_t i = 0; i < value.size(); ++i) {
        switch (value[i]) {
        case '\t':
            text.append("\\t");
            break;
        case '\n':
            text.append("\\n");
            break;
        case '\f':
            text.append("\\f");
            break;
        case '\r':
            text.append("\\r");
            break;
        case '"':
            text.append("\\\"");
            break;
        default:
            text.append(value[i]);
        }
    }
    text.append('"');
}

void append_char16(char16 value, String& text)
{
    char buffer[8];
    if (value >= 32 && value <= 126)
        std::snprintf(buffer, sizeof(buffer), "'%c'", static_cast<char>(value));
    else
        std::snprintf(buffer, sizeof(buffer), "0x%04X", static_cast<unsigned>(value));
    text.append(buffer);
}

void append_value(uint16 type, const void* value, String& text)
{
    switch (type) {
    case STRING:
        return append_quoted(*static_cast<const String*>(value), text);
    case CHAR16:
        return append_char16(*static_cast<const char16*>(value), text);
    default:
        return append_scalar(type, value, text);
    }
}

void append_brackets(sint16 subscript, String& text)
{
    if (subscript == 0) return;
    char buffer[16] = "[]";
    if (subscript > 0) std::snprintf(buffer, sizeof(buffer), "[%d]", subscript);
    text.append(buffer);
}

void append_type_and_name(const char* type, const Meta_Feature* feature, sint16 subscript, String& text)
{
    text.append(type);
    text.append(' ');
    text.append(feature->name);
    append_brackets(subscript, text);
    text.append(" =");
}

void append_elements(const Array_Base& array, uint16 type, String& text)
{
    text.append("{ ");
    for (std::size_t i = 0; i < array.size(); ++i) {
        if (i) text.append(", ");
        append_value(type, array.at(i), text);
    }
    text.append('}');
}

void append_property(const Instance* instance, const Meta_Property* property, int level, String& text)
{
    append_indent(text, level);
    append_type_and_name(type_names[property->type], property, property->subscript, text);
    text.append(' ');
    if (null_of(instance, property))
        text.append("NULL");
    else if (property->subscript)
        append_elements(array_of(instance, property), property->type, text);
    else
        append_value(property->type, feature_at(instance, property->offset), text);
    text.append(";\n");
}

void append_body(const Instance* instance, int level, bool keys_only, String& text);

void append_reference(const Instance* instance, const Meta_Reference* reference, int level, bool keys_only,
                      String& text)
{
    const Instance* target = reference->subscript ? nullptr : reference_of(instance, reference);
    append_indent(text, level);
    append_type_and_name(target ? record_of(target)->name : reference->meta_class->name, reference,
                         reference->subscript, text);
    if (target) {
        text.append('\n');
        append_body(target, level, keys_only, text);
        return;
    }
    if (!reference->subscript || null_of(instance, reference)) {
        text.append(" NULL;\n");
        return;
    }
    text.append('\n');
    append_indent(text, level);
    text.append("{\n");
    for (const Instance* element : reference_array_of(instance, reference)) {
        append_indent(text, level + 1);
        text.append(element ? record_of(element)->name : "NULL;");
        text.append('\n');
        if (element) append_body(element, level + 1, keys_only, text);
    }
    append_indent(text, level);
    text.append("}\n");
}

bool is_shown(const Meta_Feature* feature, int level, bool keys_only)
{
    if (is_method(feature)) return false;
    if (is_key(feature)) return true;
    return !keys_only && (level == 0 || (feature->flags & (META_FLAG_EMBEDDED_OBJECT | META_FLAG_EMBEDDED_INSTANCE)));
}

void append_body(const Instance* instance, int level, bool keys_only, String& text)
{
    append_indent(text, level);
    text.append("{\n");
    if (!instance->__name_space.empty()) {
        append_indent(text, level + 1);
        text.append("string __name_space = \"");
        text.append(instance->__name_space);
        text.append("\";\n");
    }
    for (const Meta_Feature* feature : features_of(record_of(instance))) {
        if (!is_shown(feature, level, keys_only)) continue;
        if (is_property(feature))
            append_property(instance, as_property(feature), level + 1, text);
        else
            append_reference(instance, as_reference(feature), level + 1, keys_only, text);
    }
    append_indent(text, level);
    text.append("}\n");
}

} // namespace

void print(std::FILE* stream, const Instance* instance, bool keys_only)
{
    if (!instance) return;
    String text;
    text.append(record_of(instance)->name);
    text.append('\n');
    append_body(instance, 0, keys_only, text);
    std::fwrite(text.c_str(), 1, text.size(), stream);
}

} // namespace cimple
