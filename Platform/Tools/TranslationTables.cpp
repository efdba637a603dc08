// Merges the fragments of one language (lines of key, text and, for plurals, further forms, separated by
// tabs) into a Qt Linguist file with text ids, which lrelease turns into the table that the program reads.
//
//     qelvar-translation-tables LANGUAGE OUTPUT.ts FRAGMENT.tsv...

#include <cstdio>
#include <fstream>
#include <iostream>
#include <map>
#include <string>
#include <vector>

namespace {

struct Entry {
    std::vector<std::string> forms;
    std::string place;
};

std::string escaped(const std::string& text) {
    std::string result;
    for (const char c : text) {
        switch (c) {
            case '&':
                result += "&amp;";
                break;
            case '<':
                result += "&lt;";
                break;
            case '>':
                result += "&gt;";
                break;
            case '"':
                result += "&quot;";
                break;
            default:
                result += c;
        }
    }
    return result;
}

// "\n" and "\\" in a fragment stand for a line feed and a backslash.
std::string unescaped(const std::string& text) {
    std::string result;
    for (size_t i = 0; i < text.size(); ++i) {
        if (text[i] == '\\' && i + 1 < text.size()) {
            ++i;
            result += text[i] == 'n' ? '\n' : text[i];
        } else {
            result += text[i];
        }
    }
    return result;
}

std::vector<std::string> fields(const std::string& line) {
    std::vector<std::string> result;
    size_t start = 0;
    while (true) {
        const size_t tab = line.find('\t', start);
        result.push_back(line.substr(start, tab == std::string::npos ? tab : tab - start));
        if (tab == std::string::npos) return result;
        start = tab + 1;
    }
}

// Forms that Linguist's plural rules know for the language; a line with fewer repeats its last.
size_t pluralForms(const std::string& language) {
    return language == "ar" ? 6 : 2;
}

bool read(const std::string& path, std::map<std::string, Entry>& entries) {
    std::ifstream file(path, std::ios::binary);
    if (!file) {
        std::cerr << path << ": cannot be read\n";
        return false;
    }
    std::string line;
    for (int number = 1; std::getline(file, line); ++number) {
        if (!line.empty() && line.back() == '\r') line.pop_back();
        if (line.empty() || line[0] == '#') continue;
        auto parts = fields(line);
        const std::string place = path + ":" + std::to_string(number);
        if (parts.size() < 2 || parts[0].empty()) {
            std::cerr << place << ": a line is a key, a tab and a text\n";
            return false;
        }
        Entry entry{{}, place};
        for (size_t i = 1; i < parts.size(); ++i) entry.forms.push_back(unescaped(parts[i]));
        const auto [position, added] = entries.emplace(parts[0], entry);
        if (!added && position->second.forms != entry.forms)
            std::cerr << place << ": warning: " << parts[0] << " has another text at "
                      << position->second.place << "\n";
    }
    return true;
}

void write(std::ostream& out, const std::string& language, const std::map<std::string, Entry>& entries) {
    out << "<?xml version=\"1.0\" encoding=\"utf-8\"?>\n<!DOCTYPE TS>\n<TS version=\"2.1\" language=\""
        << language << "\" sourcelanguage=\"en\">\n<context>\n    <name></name>\n";
    for (const auto& [key, entry] : entries) {
        const bool plural = entry.forms.size() > 1;
        out << "    <message id=\"" << escaped(key) << "\"" << (plural ? " numerus=\"yes\"" : "")
            << ">\n        <source></source>\n        <translation>";
        if (plural) {
            out << '\n';
            for (size_t i = 0; i < pluralForms(language); ++i)
                out << "            <numerusform>"
                    << escaped(entry.forms[std::min(i, entry.forms.size() - 1)]) << "</numerusform>\n";
            out << "        ";
        } else {
            out << escaped(entry.forms[0]);
        }
        out << "</translation>\n    </message>\n";
    }
    out << "</context>\n</TS>\n";
}

}  // namespace

int main(int argc, char** argv) {
    if (argc < 3) {
        std::cerr << "usage: qelvar-translation-tables LANGUAGE OUTPUT.ts FRAGMENT.tsv...\n";
        return 2;
    }
    std::map<std::string, Entry> entries;
    for (int i = 3; i < argc; ++i)
        if (!read(argv[i], entries)) return 1;
    std::ofstream out(argv[2], std::ios::binary | std::ios::trunc);
    write(out, argv[1], entries);
    out.flush();
    if (!out) {
        std::cerr << argv[2] << ": cannot be written\n";
        return 1;
    }
    return 0;
}
