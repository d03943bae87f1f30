#include "utils/json.h"

#include <cstdio>
#include <cstring>
#include <memory>
#include <new>

#include "utils/cleanse.h"

// Json::Reader and Json::FastWriter are marked deprecated, but what they accept and how they write is what the
// provider's documents, the configuration files and the relay page have always been read and written with.
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
    const CleanseOnExit cleanse(chunk, sizeof chunk);  // the client secret passes through
    while (const std::size_t length = std::fread(chunk, 1, sizeof chunk, file.get())) {
        AppendSecret(content, chunk, length);
    }
    return std::ferror(file.get()) == 0;
}

}  // namespace

bool ParseJson(std::string_view text, Json::Value &document) {
    Json::Value parsed;  // of which nothing gets out unless all of it is there
    try {
        Json::Reader reader;
        // By its bounds: given the string, the reader would keep a copy, and the text may hold the client secret.
        if (reader.parse(text.data(), text.data() + text.size(), parsed, true)) {
            document.swap(parsed);
            return true;
        }
    } catch (const Json::Exception &) {
        // Too deeply nested: refused by throwing, and no better than any other malformed text.
    }
    document = Json::Value();
    return false;
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
        throw std::bad_alloc();  // the JSON library's own word for no memory
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
