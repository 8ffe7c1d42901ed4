#include "generator/Reference.h"

#include <algorithm>
#include <fstream>

namespace generator {
namespace {

std::string trimmed(const std::string& text)
{
    const auto first = text.find_first_not_of(" \t\r");
    if (first == std::string::npos) return "";
    return text.substr(first, text.find_last_not_of(" \t\r") - first + 1);
}

/// If `line` begins with `word` and a blank: what stands behind it, else "".
std::string behind(const std::string& line, const std::string& word)
{
    return line.compare(0, word.size() + 1, word + " ") == 0 ? trimmed(line.substr(word.size())) : "";
}

bool holds(const Subject& subject, const mof::Class* target)
{
    return std::find(subject.classes.begin(), subject.classes.end(), target) != subject.classes.end();
}

} // namespace

std::vector<Subject> read_subjects(const Catalogue& catalogue, const std::string& file)
{
    std::ifstream stream(file);
    if (!stream) throw Error(file + ": cannot read the file");
    std::vector<Subject> subjects;
    std::size_t number = 0;
    for (std::string line; std::getline(stream, line);) {
        ++number;
        const auto fail = [&](const std::string& why) {
            throw Error(file + ":" + std::to_string(number) + ": " + why);
        };
        line = trimmed(line);
        if (line.empty() || line[0] == '#') continue;
        const std::string profile = behind(line, "profile"), beyond = behind(line, "beyond");
        if (!profile.empty() || !beyond.empty()) {
            Subject subject;
            subject.is_profile = !profile.empty();
            subject.name = subject.is_profile ? profile : beyond;
            subjects.push_back(std::move(subject));
            continue;
        }
        if (subjects.empty()) fail("say \"profile NAME\" or \"beyond NAME\" first");
        const std::string about = behind(line, "about");
        if (!about.empty()) {
            subjects.back().about = about;
            continue;
        }
        const mof::Class* target = catalogue.mof.find_class(line);
        if (!target) fail("no MOF file declares \"" + line + "\"");
        if (holds(subjects.back(), target))
            fail("\"" + line + "\" is listed twice in \"" + subjects.back().name + "\"");
        subjects.back().classes.push_back(target);
    }
    for (const Subject& subject : subjects)
        if (subject.about.empty()) throw Error(file + ": \"" + subject.name + "\" does not say what it is about");
    for (const Provider& provider : catalogue.providers)
        if (std::none_of(subjects.begin(), subjects.end(),
                         [&](const Subject& subject) { return holds(subject, provider.target); }))
            throw Error(file + ": \"" + provider.target->name + "\" has a provider and stands under no profile");
    return subjects;
}

} // namespace generator
