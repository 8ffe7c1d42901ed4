#include "host/command/Completion.h"

#include "host/Manner.h"

#include <CLI/CLI.hpp>

#include <set>
#include <vector>

namespace host {
namespace {

constexpr const char* head = "# Completion of nvrcim for bash, made by \"nvrcim completion\".\n"
                             "_nvrcim()\n"
                             "{\n"
                             "    local word=${COMP_WORDS[COMP_CWORD]} verb='' words='' classes='' i\n"
                             "    for ((i = 1; i < COMP_CWORD; i++)); do\n"
                             "        case ${COMP_WORDS[i]} in\n"
                             "        @valued@) ((i++)) ;;\n"
                             "        -* | =) ;;\n"
                             "        *) verb+=${verb:+ }${COMP_WORDS[i]} ;;\n"
                             "        esac\n"
                             "    done\n"
                             "    case ${COMP_WORDS[COMP_CWORD - 1]} in\n"
                             "    --scenario | --module | --mof | --server-log)\n"
                             "        COMPREPLY=($(compgen -f -- \"$word\"))\n"
                             "        return\n"
                             "        ;;\n"
                             "    --manner)\n"
                             "        COMPREPLY=($(compgen -W '@manners@' -- \"$word\"))\n"
                             "        return\n"
                             "        ;;\n"
                             "    @valued@) return ;;\n"
                             "    esac\n"
                             "    case $verb in\n";

constexpr const char* tail =
    "    esac\n"
    "    [[ $classes ]] && words+=\" $(\"${COMP_WORDS[0]}\" classes --csv 2>/dev/null | tail -n +2 | cut -d, -f1)\"\n"
    "    COMPREPLY=($(compgen -W \"$words\" -- \"$word\"))\n"
    "}\n"
    "complete -o default -F _nvrcim nvrcim\n";

using Names = std::vector<std::string>;

std::string joined(const Names& names, const char* between)
{
    std::string text;
    for (const std::string& name : names)
        text += (text.empty() ? "" : between) + name;
    return text;
}

/// The options of an app, as they are typed; or only those that take a value.
Names options_of(const CLI::App& app, bool valued)
{
    Names names;
    for (const CLI::Option* option : app.get_options()) {
        if (valued && option->get_items_expected_max() == 0) continue;
        for (const std::string& name : option->get_snames())
            names.push_back("-" + name);
        for (const std::string& name : option->get_lnames())
            names.push_back("--" + name);
    }
    return names;
}

std::vector<const CLI::App*> verbs_of(const CLI::App& app)
{
    return app.get_subcommands([](const CLI::App*) { return true; });
}

class Script {
public:
    explicit Script(const CLI::App& app) : m_common(joined(options_of(app, false), " ")) { add(app, ""); }

    std::string text() const
    {
        std::string manners;
        for (const Manner* manner : Manner::all())
            manners += (manners.empty() ? "" : " ") + std::string(manner->name);
        std::string text = head + m_branches + tail;
        replace_all(text, "@valued@", joined({m_valued.begin(), m_valued.end()}, " | "));
        replace_all(text, "@manners@", manners);
        return text;
    }

private:
    /// The branch of a verb stands behind those of its own verbs, whose words begin with its.
    void add(const CLI::App& app, const std::string& path)
    {
        Names words;
        for (const CLI::App* verb : verbs_of(app)) {
            add(*verb, path + (path.empty() ? "" : "\\ ") + verb->get_name());
            words.push_back(verb->get_name());
        }
        for (const std::string& name : options_of(app, true))
            m_valued.insert(name);
        if (!path.empty())
            for (const std::string& name : options_of(app, false))
                if ((" " + m_common + " ").find(" " + name + " ") == std::string::npos) words.push_back(name);
        m_branches += "    " + (path.empty() ? "''" : path + " | " + path + "\\ *") + ")\n";
        m_branches += "        words='" + joined(words, " ") + " " + m_common + "'\n";
        const CLI::Option* object = app.get_option_no_throw("class");
        if (object && object->get_positional()) m_branches += "        classes=yes\n";
        m_branches += "        ;;\n";
    }

    static void replace_all(std::string& text, const std::string& from, const std::string& to)
    {
        for (std::size_t at = text.find(from); at != std::string::npos; at = text.find(from, at + to.size()))
            text.replace(at, from.size(), to);
    }

    const std::string m_common;
    std::set<std::string> m_valued;
    std::string m_branches;
};

} // namespace

std::string bash_completion(const CLI::App& app)
{
    return Script(app).text();
}

} // namespace host
