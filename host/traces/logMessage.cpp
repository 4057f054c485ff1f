#include "traces/logMessage.h"

#include "text/json.h"
#include "text/words.h"
#include "traces/lineShape.h"

#include <algorithm>
#include <cctype>

namespace dravikHost {

namespace {

std::string_view trimmed(std::string_view text)
{
    while (!text.empty() && std::isspace(static_cast<unsigned char>(text.front())) != 0)
        text.remove_prefix(1);
    while (!text.empty() && std::isspace(static_cast<unsigned char>(text.back())) != 0)
        text.remove_suffix(1);
    return text;
}

bool isName(std::string_view word)
{
    return !word.empty() && std::isalpha(static_cast<unsigned char>(word.front())) != 0 &&
           std::all_of(word.begin(), word.end(), [](unsigned char character) {
               return std::isalnum(character) != 0 || character == '_' || character == '-' ||
                      character == '.' || character == '@';
           });
}

bool isCount(std::string_view text) { return numberIn<uint64_t>(text).has_value(); }

// "phc2sys[716]:", "ptp4l:" or "ptp4l", and before it perhaps a host.
void takeProgram(tLogMessage& message, std::string_view prefix)
{
    const tWords words = wordsOf(prefix);
    if (words.empty()) return;
    std::string_view word = words.back();
    if (word.back() == ':') word.remove_suffix(1);
    std::string_view process;
    const size_t open = word.find('[');
    if (open != std::string_view::npos && word.back() == ']') {
        process = word.substr(open + 1, word.size() - open - 2);
        word = word.substr(0, open);
    }
    const size_t path = word.rfind('/');
    if (path != std::string_view::npos) word = word.substr(path + 1);
    const size_t file = word.rfind(':'); // as grep puts it in front
    if (file != std::string_view::npos) word = word.substr(file + 1);
    if (!isName(word)) return;
    message.program = word;
    if (words.size() > 1 && isName(words[words.size() - 2]))
        message.process = words[words.size() - 2];
    if (isCount(process))
        message.process.append(message.process.empty() ? "" : " ").append(process);
}

// The last bracket with a decimal point is the program's own stamp: a journal's may stand before
// it, and the number of the process has none.
tLogMessage plainMessage(std::string_view line)
{
    tLogMessage message;
    message.text = line;
    const size_t offset = std::min({line.find(" offset "), line.find(" rms "), line.size()});
    size_t from = 0;
    for (size_t open = line.find('['); open < offset; open = line.find('[', open + 1)) {
        const size_t close = line.find(']', open);
        if (close == std::string_view::npos) break;
        const std::string_view inside = trimmed(line.substr(open + 1, close - open - 1));
        if (inside.find('.') == std::string_view::npos || !secondsIn(inside)) continue;
        message.seconds = inside;
        message.text = line.substr(close + 1);
        message.program.clear();
        message.process.clear();
        takeProgram(message, line.substr(from, open - from));
        from = close + 1;
    }
    const std::string_view text = message.text;
    message.text = trimmed(text.substr(!text.empty() && text.front() == ':' ? 1 : 0));
    return message;
}

std::string textOf(const cJSON* object, const char* key)
{
    const cJSON* const value = cJSON_GetObjectItemCaseSensitive(object, key);
    return cJSON_IsString(value) != 0 ? value->valuestring : "";
}

tLogMessage jsonMessage(const cJSON* object)
{
    for (const char* const key : {"MESSAGE", "log", "message", "msg"}) {
        const std::string text = textOf(object, key);
        if (text.empty()) continue;
        tLogMessage message = plainMessage(trimmed(text));
        if (message.program.empty()) message.program = textOf(object, "SYSLOG_IDENTIFIER");
        if (message.process.empty())
            message.process = trimmed(textOf(object, "_HOSTNAME") + " " + textOf(object, "_PID"));
        return message;
    }
    return {};
}

} // namespace

tLogMessage messageIn(std::string_view line)
{
    line = trimmed(line);
    if (line.empty() || line.front() != '{') return plainMessage(line);
    const tJson object = parseJson(std::string(line));
    return object != nullptr ? jsonMessage(object.get()) : plainMessage(line);
}

} // namespace dravikHost
