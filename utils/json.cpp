#include "utils/json.h"

#include <cstdio>
#include <cstring>
#include <memory>
#include <new>

#include "utils/cleanse.h"

// Json::Reader and Json::FastWriter are deprecated, but existing files, providers and relay pages depend on their
// format.
#pragma GCC diagnostic ignored "-Wdeprecated-declarations"

namespace TAVO::Utils {

namespace {

struct CloseFile {
    void operator()(std::FILE *file) const { std::fclose(file); }
};

bool ReadFile(const char *path, std::string &content) {
    const std::unique_ptr<std::FILE, CloseFile> file(std::fopen(path, "re"));
    if (!file) {
        return false;
    }
    char chunk[4096];
    const CleanseOnExit cleanse(chunk, sizeof chunk);  // may contain the client secret
    while (const std::size_t length = std::fread(chunk, 1, sizeof chunk, file.get())) {
        AppendSecret(content, chunk, length);
    }
    return std::ferror(file.get()) == 0;
}

/// jsoncpp throws the same class if memory runs out; only the text differs.
bool IsNestedTooDeeply(const Json::RuntimeError &error) { return std::strstr(error.what(), "stackLimit") != nullptr; }

/// Parses a text. After a failure `document` contains the members read so far.
bool Parse(std::string_view text, Json::Value &document) {
    try {
        // Pointers, because the reader would keep a copy of a std::string, which may contain the client secret.
        return Json::Reader().parse(text.data(), text.data() + text.size(), document, true);
    } catch (const Json::RuntimeError &error) {
        if (IsNestedTooDeeply(error)) {
            return false;
        }
        throw std::bad_alloc();
    }
}

}  // namespace

bool ParseJson(std::string_view text, Json::Value &document) {
    Json::Value parsed;
    const bool isJson = Parse(text, parsed);
    if (!isJson) {
        parsed = Json::Value();
    }
    document.swap(parsed);
    return isJson;
}

bool LoadJsonFile(const char *path, Json::Value &document) {
    std::string content;
    const CleanseTextOnExit cleanse(content);
    return ReadFile(path, content) && ParseJson(content, document);
}

Json::Value WithMember(const Json::Value &document, const char *name, const std::string &text) {
    try {
        Json::Value copy = document;
        copy[name] = text;
        return copy;
    } catch (const Json::RuntimeError &) {
        throw std::bad_alloc();  // the only reason why a copy fails
    }
}

std::string WriteCompactJson(const Json::Value &document) { return Json::FastWriter().write(document); }

const Json::Value *FindMember(const Json::Value &document, const char *name) {
    return document.isObject() ? document.find(name, name + std::strlen(name)) : nullptr;
}

bool ReadMember(const Json::Value &document, const char *name, std::string &field) {
    const Json::Value *member = FindMember(document, name);
    if (member == nullptr || !member->isString()) {
        return false;
    }
    field = member->asString();
    return true;
}

bool ReadMember(const Json::Value &document, const char *name, bool &field) {
    const Json::Value *member = FindMember(document, name);
    if (member == nullptr || !member->isBool()) {
        return false;
    }
    field = member->asBool();
    return true;
}

void ReadMembers(const Json::Value &document, std::initializer_list<StringMember> members) {
    for (const StringMember &member : members) {
        ReadMember(document, member.name, member.field);
    }
}

std::optional<std::string> MemberText(const Json::Value &document, const char *name) {
    const Json::Value *member = FindMember(document, name);
    if (member == nullptr) {
        return std::string();
    }
    if (member->isArray() || member->isObject()) {
        return std::nullopt;
    }
    return member->asString();
}

bool MemberTextIs(const Json::Value &document, const char *name, const std::string &expected) {
    const std::optional<std::string> text = MemberText(document, name);
    return text && *text == expected;
}

}  // namespace TAVO::Utils
