#include "services/ApexConfig.h"

#include <cstdio>
#include <cstring>
#include <stdexcept>

#include <rapidxml/rapidxml.hpp>
#include <rapidxml/rapidxml_print.hpp>

#include "foundation/CLogger.h"
#include "foundation/NVR_Common.h"

namespace cimple {

namespace {

using Document = rapidxml::xml_document<>;
using Node = rapidxml::xml_node<>;

// ------------------------------------------------------------------------------------------------------------ writing

/// Appends elements, copying their texts into the document.
class Writer {
public:
    explicit Writer(Document& document) : m_document(document) {}

    void declaration()
    {
        Node* declaration = m_document.allocate_node(rapidxml::node_declaration);
        declaration->append_attribute(m_document.allocate_attribute("version", "1.0"));
        declaration->append_attribute(m_document.allocate_attribute("encoding", "utf-8"));
        m_document.append_node(declaration);
    }
    Node& group(Node& parent, const char* name)
    {
        Node* node = m_document.allocate_node(rapidxml::node_element, name);
        parent.append_node(node);
        return *node;
    }
    void element(Node& parent, const char* name, const char* text)
    {
        group(parent, name).value(m_document.allocate_string(text));
    }
    void number(Node& parent, const char* name, int value)
    {
        char text[16];
        std::snprintf(text, sizeof text, "%d", value);
        element(parent, name, text);
    }
    void wwn(Node& parent, const char* name, const HBA_WWN& wwn)
    {
        char text[wwn_text_size];
        wwn2String(text, wwn);
        element(parent, name, text);
    }

private:
    Document& m_document;
};

// ------------------------------------------------------------------------------------------------------------ reading

constexpr std::size_t most_depth = 64;
constexpr std::size_t most_parts = 1024 * 1024; // tags and attributes; a file of the most entries has fewer

/// The parser calls itself for each level and keeps a record of each part: this walks the markup as it does, but
/// without either, and finds what would exhaust stack or memory. Bad syntax ends the walk: that is left to the parser.
class Markup_Walk {
public:
    explicit Markup_Walk(const char* text) : m_at(text) {}

    void run()
    {
        while ((m_at = std::strchr(m_at, '<')) && markup())
            count_part();
    }

private:
    bool markup()
    {
        if (begins("<?")) return skip(2) && past("?>");
        if (begins("<!--")) return skip(4) && past("-->");
        if (begins("<![CDATA[")) return skip(9) && past("]]>");
        if (begins("<!DOCTYPE") && is_space(m_at[9])) return skip(10) && past_doctype();
        if (begins("<!")) return skip(2) && past(">");
        if (begins("</")) return closing();
        return element();
    }

    bool closing()
    {
        if (m_depth == 0) return false;
        m_depth--;
        skip(2);
        past_any_but(" \n\r\t/>?");
        past_space();
        return is('>');
    }

    bool element()
    {
        if (m_depth >= most_depth) throw std::runtime_error("elements are nested too deeply");
        skip(1);
        if (past_any_but(" \n\r\t/>?") == 0) return false;
        past_space();
        while (past_any_but(" \n\r\t/<>=?!") > 0)
            if (!attribute()) return false;
        if (is('>')) {
            m_depth++;
            return true;
        }
        return is('/') && is('>');
    }

    bool attribute()
    {
        count_part();
        past_space();
        if (!is('=')) return false;
        past_space();
        const char quote = *m_at;
        if (quote != '"' && quote != '\'') return false;
        const char* end = std::strchr(m_at + 1, quote);
        if (!end) return false;
        m_at = end + 1;
        past_space();
        return true;
    }

    bool past_doctype()
    {
        for (; *m_at && *m_at != '>'; m_at++) {
            if (*m_at != '[') continue;
            for (std::size_t open = 1; open > 0;) {
                m_at++;
                if (!*m_at) return false;
                open += *m_at == '[';
                open -= *m_at == ']';
            }
        }
        return is('>');
    }

    bool begins(const char* word) const { return std::strncmp(m_at, word, std::strlen(word)) == 0; }
    static bool is_space(char c) { return c == ' ' || c == '\n' || c == '\r' || c == '\t'; }
    bool skip(std::size_t characters)
    {
        m_at += characters;
        return true;
    }
    bool is(char expected)
    {
        if (*m_at != expected) return false;
        m_at++;
        return true;
    }
    void past_space()
    {
        while (is_space(*m_at))
            m_at++;
    }
    std::size_t past_any_but(const char* these)
    {
        const std::size_t size = std::strcspn(m_at, these);
        m_at += size;
        return size;
    }
    bool past(const char* word)
    {
        const char* found = std::strstr(m_at, word);
        if (!found) return false;
        m_at = found + std::strlen(word);
        return true;
    }
    void count_part()
    {
        if (++m_parts > most_parts) throw std::bad_alloc();
    }

    const char* m_at;
    std::size_t m_depth = 0;
    std::size_t m_parts = 0;
};

const Node& found(const Node* node, const char* what)
{
    if (node) return *node;
    throw std::runtime_error(std::string(what) + " is not found or corrupted in the Apex config table");
}

const Node& child(const Node& parent, const char* name, const char* what)
{
    return found(parent.first_node(name), what);
}

const Node& next(const Node& node, const char* name, const char* what)
{
    return found(node.next_sibling(name), what);
}

/// The same of a Row, with the words of its own.
const Node& field(const Node* node, const char* failure)
{
    if (node) return *node;
    throw std::runtime_error(failure);
}

void readName(HBA_WWN& wwn, const Node& node)
{
    if (string2HBAName(&wwn, node.value()) == 0) NVR_LOG("SetConfigTable::unable to convert string to hbaname ");
}

void readRow(CPQFC_QOSENTRY& entry, const Node& row)
{
    const Node& source = field(row.first_node("src_wwpn"), "SetConfigTable::malformed src_wwpn field ");
    readName(entry.source, source);
    const Node& target = field(source.next_sibling("tgt_wwpn"), "SetConfigTable::malformed tgt_wwpn field ");
    readName(entry.target, target);
    const Node& tag = field(target.next_sibling("tag"), "SetConfigTable:: malformed tag field ");
    entry.tag = static_cast<uint8>(std::strtol(tag.value(), nullptr, 10));
}

/// The node behind which the rows stand, all that must come before it being there.
const Node& numberOfEntries(const Document& document)
{
    const Node& apex = child(document, "ApexConfig", "apexConfigNode");
    const Node& system = child(apex, "theSystem", "theSystemNode");
    const Node& version = child(system, "ApexVersion", "apexVersionNode");
    const Node& created = next(version, "CreationDate", "creationTimeNode");
    const Node& host = next(created, "HostName", "hostNameNode");
    next(host, "Adapter", "adapterNode");
    const Node& configuration = next(system, "Configuration", "configurationNode");
    return child(configuration, "numberOfEntries", "numberOfEntriesNode");
}

Tag_Table tableFor(long entries)
{
    try {
        return makeTagTable(entries);
    } catch (const std::bad_alloc&) {
        NVR_LOG("SetConfigTable::Memory Allocation Failed ");
        throw;
    }
}

} // namespace

std::string apexConfigText(const Tag_Table& table, const Apex_Origin& origin)
{
    const auto document = std::make_unique<Document>(); // too large for a server's small stacks
    Writer writer(*document);
    writer.declaration();
    Node& apex = writer.group(*document, "ApexConfig");
    Node& system = writer.group(apex, "theSystem");
    writer.element(system, "ApexVersion", "1.0");
    writer.element(system, "CreationDate", origin.created.c_str());
    writer.element(system, "HostName", origin.host.c_str());
    writer.element(system, "Adapter", origin.adapter.c_str());
    Node& configuration = writer.group(apex, "Configuration");
    writer.number(configuration, "numberOfEntries", static_cast<int>(table.size()));
    for (uint32 i = 0; i < table.size(); i++) {
        Node& row = writer.group(configuration, "Row");
        writer.wwn(row, "src_wwpn", table[i].source);
        writer.wwn(row, "tgt_wwpn", table[i].target);
        writer.element(row, "reserved1", "00000000000000000000000000000000");
        writer.number(row, "tag", table[i].tag);
        writer.element(row, "reserved2", "000000");
    }
    std::string text;
    rapidxml::print(std::back_inserter(text), *document);
    return text;
}

Tag_Table readApexConfig(std::string text)
{
    Markup_Walk(text.c_str()).run();
    const auto document = std::make_unique<Document>();
    try {
        document->parse<rapidxml::parse_default>(text.data());
    } catch (const rapidxml::parse_error& error) {
        throw std::runtime_error(error.what());
    }
    const Node& number = numberOfEntries(*document);
    const Node* row = &next(number, "Row", "rowNode");
    Tag_Table table = tableFor(std::strtol(number.value(), nullptr, 10));
    for (uint32 i = 0; i < table.size() && row; i++, row = row->next_sibling("Row"))
        readRow(table[i], *row);
    return table;
}

} // namespace cimple
