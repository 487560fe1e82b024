#include "tools/MessageLine.h"

#include <algorithm>
#include <charconv>

#include "kelbaselib/InMemoryBytestream.h"
#include "rox/RoxStringArray.h"
#include "sorn/dict/Dict.h"
#include "sorn/dict/Dictionary.h"
#include "sorn/lazy/LazyDict.h"
#include "sorn/rpc/CancelWrapper.h"
#include "sorn/rpc/RequestUpdateWrapper.h"
#include "sorn/rpc/RequestWrapper.h"
#include "sorn/rpc/ResponseWrapper.h"
#include "tools/JsonText.h"

namespace sorn::tools {

namespace {

void Put(std::string_view text, std::FILE* out) {
    std::fwrite(text.data(), 1, text.size(), out);
}

/// All bytes of it, NULs included.
RoxString ToText(std::string_view text) {
    return RoxString::FromUtf8Bytes(nullptr, static_cast<unsigned>(text.size()), text.data());
}

void PutHeaders(const Dict& headers, std::FILE* out) {
    RoxStringArray names;
    headers.GetSortedNames(names);
    Put(",\"headers\":{", out);
    for (unsigned i = 0; i < names.GetCount(); ++i) {
        const unsigned nValues = headers.CountValues(names[i]);
        Put((i == 0 ? "" : ",") + Quoted(names[i].View()) + (nValues == 1 ? ":" : ":["), out);
        for (unsigned index = 0; index < nValues; ++index) {
            Put((index == 0 ? "" : ",") + Quoted(headers.GetString(names[i], index).View()), out);
        }
        if (nValues != 1) Put("]", out);
    }
    Put("}", out);
}

/// Whether any reader of JSON takes the text for an object.
bool FJsonObject(const RoxString& text, RoxMempool* pool) {
    RoxString words;
    kelbaselib::InMemoryBytestream stream;
    stream.Write(text.Utf8(), text.NByte());
    return Dictionary::FromJsonBytesource(stream.NewSource(), words, pool) != nullptr && words.FEmpty();
}

void PutBody(OrvoRpcWrapper& message, RoxMempool* pool, std::FILE* out) {
    const RoxString body = message.BodyToJson(false);
    if (!FJsonObject(body, pool)) {
        Put(",\"body\":" + Quoted(body.View()), out);
        return;
    }
    std::string line(body.View());
    // The library takes the last two for blanks, other readers do not.
    const auto isBreak = [](char c) { return c == '\n' || c == '\r' || c == '\v' || c == '\f'; };
    // Blanks around a value are lost on its reader.
    const bool isExact =
        line.front() == '{' && line.back() == '}' && std::none_of(line.begin(), line.end(), isBreak);
    std::replace_if(line.begin(), line.end(), isBreak, ' ');
    Put(",\"body\":" + line, out);
    if (!isExact) Put(",\"bodyText\":" + Quoted(body.View()), out);
}

std::string Kind(const char* kind, const OrvoRpcWrapper& message) {
    return std::string("{\"kind\":\"") + kind + "\",\"rpcId\":" + std::to_string(message.GetRpcId());
}

/// The members of a line while it is read; the first failure keeps its words.
class Members {
 public:
    bool Read(const std::string& line) {
        return SplitObject(line, vMembersM) || Fail("the line is no JSON object");
    }
    bool Fail(const std::string& words) {
        if (wordsM.empty()) wordsM = words;
        return false;
    }
    const std::string& GetWords() const { return wordsM; }

    /// Null without such a member.
    const std::string_view* Find(std::string_view name) const {
        const auto found = std::find_if(vMembersM.begin(), vMembersM.end(),
                                        [name](const auto& member) { return member.first == name; });
        return found == vMembersM.end() ? nullptr : &found->second;
    }
    std::string Text(const char* name) {
        const std::string_view* const raw = Find(name);
        std::string text;
        if (raw == nullptr || !Unquote(*raw, text)) Fail(std::string(name) + " is no string");
        return text;
    }
    /// A text that can stand in a header line.
    RoxString Line(const char* name) {
        const std::string text = Text(name);
        if (!FOneLine(text)) Fail(std::string(name) + " is not on one line");
        return ToText(text);
    }
    uint32_t Number(const char* name) {
        const std::string_view* const raw = Find(name);
        uint32_t number = 0;
        const char* const end = raw == nullptr ? nullptr : raw->data() + raw->size();
        const bool isNumber = raw != nullptr && std::from_chars(raw->data(), end, number).ptr == end &&
                              *raw == std::to_string(number);
        if (!isNumber) Fail(std::string(name) + " is no number");
        return number;
    }
    bool Flag(const char* name) {
        const std::string_view* const raw = Find(name);
        if (raw == nullptr || (*raw != "true" && *raw != "false")) Fail(std::string(name) + " is no bool");
        return raw != nullptr && *raw == "true";
    }

 private:
    RawMembers vMembersM;
    std::string wordsM;
};

/// Adds the headers of the line: an object of strings and of arrays of strings.
template <class Wrapper>
void ReadHeaders(Members& members, Wrapper& message) {
    RawMembers vHeaders;
    const std::string_view* const raw = members.Find("headers");
    bool isRead = raw != nullptr && SplitObject(*raw, vHeaders);
    for (const auto& [name, value] : vHeaders) {
        std::vector<std::string_view> vValues;
        if (!SplitArray(value, vValues)) vValues = {value};
        for (std::string_view each : vValues) {
            std::string text;
            if (!Unquote(each, text)) {
                isRead = false;
            } else if (!FOneLine(name) || name.find(':') != std::string::npos || !FOneLine(text) ||
                       !message.AddOptionalHeader(ToText(name), ToText(text))) {
                members.Fail("a header is reserved, or none on one line: " + Quoted(name));
            }
        }
    }
    if (!isRead) members.Fail("headers is no object of strings");
}

ref<LazyDict> ReadBody(RoxMempool* pool, Members& members, int version) {
    const std::string_view* raw = members.Find("bodyText");
    if (raw == nullptr) raw = members.Find("body");
    std::string words;
    std::string text;
    if (raw == nullptr) {
        members.Fail("body is missing");
        return nullptr;
    }
    if (Unquote(*raw, text)) raw = nullptr;
    ref<LazyDict> body = NewBody(pool, raw != nullptr ? *raw : std::string_view(text), version, words);
    if (body == nullptr) members.Fail(words);
    return body;
}

ref<OrvoRpcWrapper> ReadRequest(RoxMempool* pool, Members& members) {
    RequestWrapper::ResponseCount count = RequestWrapper::RESPONSE_COUNT_NONE;
    if (!RequestWrapper::ParseResponseCount(members.Text("responseCount"), count)) {
        members.Fail("responseCount is none of none, single and multiple");
    }
    const int version = static_cast<int>(members.Number("schemaVersion"));
    const ref<RequestWrapper> request =
        RequestWrapper::New(pool, members.Number("rpcId"), members.Line("requestType"), count, version,
                            ReadBody(pool, members, version), nullptr);
    ReadHeaders(members, *request);
    return request;
}

ref<OrvoRpcWrapper> ReadUpdate(RoxMempool* pool, Members& members) {
    const ref<RequestUpdateWrapper> update = RequestUpdateWrapper::New(
        pool, members.Number("rpcId"), members.Line("requestType"), ReadBody(pool, members, 0), nullptr);
    ReadHeaders(members, *update);
    return update;
}

ref<OrvoRpcWrapper> ReadResponse(RoxMempool* pool, Members& members) {
    const ref<LazyDict> body = ReadBody(pool, members, 0);
    if (body == nullptr) return nullptr;
    const ref<ResponseWrapper> response =
        ResponseWrapper::New(pool, members.Number("rpcId"), members.Flag("isFinal"), body, nullptr);
    response->SetContentType(members.Line("contentType"));
    ReadHeaders(members, *response);
    return response;
}

ref<OrvoRpcWrapper> ReadMessage(RoxMempool* pool, Members& members) {
    const std::string kind = members.Text("kind");
    if (kind == "request") return ReadRequest(pool, members);
    if (kind == "requestUpdate") return ReadUpdate(pool, members);
    if (kind == "response") return ReadResponse(pool, members);
    if (kind == "cancel") return CancelWrapper::New(pool, members.Number("rpcId"), nullptr);
    members.Fail("kind is none of request, requestUpdate, response and cancel");
    return nullptr;
}

}  // namespace

void WriteMessageLine(OrvoRpcWrapper& message, RoxMempool* pool, std::FILE* out) {
    if (auto* request = dynamic_cast<RequestWrapper*>(&message)) {
        const bool isUpdate = dynamic_cast<RequestUpdateWrapper*>(&message) != nullptr;
        Put(Kind(isUpdate ? "requestUpdate" : "request", message) + ",\"schemaVersion\":" +
                std::to_string(static_cast<uint32_t>(message.GetOrvoVersion().Number())) +
                ",\"requestType\":" + Quoted(request->GetRequestType().View()) + ",\"responseCount\":\"" +
                RequestWrapper::ResponseCountWord(request->GetResponseCount()) +
                "\",\"contentType\":" + Quoted(request->GetContentType().View()),
            out);
        PutHeaders(*request->GetOptionalHeaders(), out);
        PutBody(message, pool, out);
    } else if (auto* response = dynamic_cast<ResponseWrapper*>(&message)) {
        Put(Kind("response", message) + ",\"isFinal\":" + (response->IsFinalResponse() ? "true" : "false") +
                ",\"contentType\":" + Quoted(response->GetContentType().View()),
            out);
        PutHeaders(*response->GetOptionalHeaders(), out);
        PutBody(message, pool, out);
    } else {
        Put(Kind("cancel", message), out);
    }
    Put("}\n", out);
}

bool FOneLine(std::string_view text) {
    return text.find("\r\n") == std::string_view::npos;
}

ref<LazyDict> NewBody(RoxMempool* pool, std::string_view text, int version, std::string& words) {
    if (text.empty() || (text[0] != '{' && text[0] != ' ')) {
        words = "the body does not open with a brace";
        return nullptr;
    }
    return LazyDict::FromJsonString(pool, ToText(text), version);
}

ref<OrvoRpcWrapper> ReadMessageLine(RoxMempool* pool, const std::string& line, std::string& words) {
    Members members;
    ref<OrvoRpcWrapper> message = members.Read(line) ? ReadMessage(pool, members) : nullptr;
    words = members.GetWords();
    return words.empty() ? message : nullptr;
}

}  // namespace sorn::tools
