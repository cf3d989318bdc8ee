#include "edit/project/detail/project_files.h"

#include "platform/services/atomic_batch.h"
#include "platform/store/text_file.h"

namespace Qx::detail {

configb emptySettings() {
    return configb("PROJECT", "END_PROJECT");
}

String settingsPath(const String& folder) {
    return joinPath(folder, "Project.txt");
}

String lockPath(const String& folder) {
    return joinPath(folder, "Project.lock");
}

Status readStore(const String& path, configb& store, bool& found) {
    found = false;
    const FileAnswer present = askFile(path);
    if (auto error = present.obstacle("read")) {
        return error.status();
    }
    if (present.isMissing()) {
        return {};
    }
    TextFile file;
    if (auto loaded = file.load(path, kProjectTextLimit); !loaded) {
        return loaded;
    }
    unsigned after = 0;
    if (auto built = store.buildFrom(file, 0, after); !built) {
        return built.retold(path + ": " + built.reason());
    }
    found = true;
    return {};
}

Status writeStore(const String& path, const configb& store) {
    TextFile file;
    store.writeTo(file);
    const AtomicBatch::Pause pause;
    return file.save(path);
}

Status readNextEditNumber(const configb& settings, const String& path, int& number) {
    const int next = settings.getInt(kNextEditKey, settings.contains(kNextEditKey) ? 0 : 1);
    if (next < 1 || next > kLastEditNumber + 1) {
        return Status::failure(
            StatusCode::Damaged,
            String::format(
                "%s: %s must be a whole number from 1 to %d; set it above every edit of the project",
                path.c_str(), kNextEditKey, kLastEditNumber + 1));
    }
    number = next;
    return {};
}

namespace {

/// Reads "12" or "12-15"; the numbers come after those that are there.
bool appendRange(std::string_view text, std::vector<int>& numbers) {
    const size_t dash = text.find('-');
    int first = 0;
    int last = 0;
    if (!textToInt(text.substr(0, dash), first) ||
        !textToInt(dash == std::string_view::npos ? text : text.substr(dash + 1), last) || first < 1 ||
        last < first || last > kLastEditNumber || (!numbers.empty() && first <= numbers.back())) {
        return false;
    }
    for (int number = first; number <= last; ++number) {
        numbers.push_back(number);
    }
    return true;
}

} // namespace

Status readTakenNumbers(const configb& settings, const String& path, std::vector<int>& numbers) {
    const String text = settings.getString(kTakenEditsKey);
    std::vector<int> read;
    for (std::string_view rest(text); !rest.empty();) {
        const size_t end = rest.find(' ');
        if (!appendRange(rest.substr(0, end), read)) {
            return Status::failure(
                StatusCode::Damaged,
                path + ": " + kTakenEditsKey +
                    " must be numbers of edits and ranges of them in ascending order, such "
                    "as \"12 15-17\"; correct it");
        }
        rest = end == std::string_view::npos ? std::string_view() : rest.substr(end + 1);
    }
    numbers.insert(numbers.end(), read.begin(), read.end());
    return {};
}

void setTakenNumbers(configb& settings, const std::vector<int>& numbers) {
    String text;
    for (size_t i = 0; i < numbers.size();) {
        size_t last = i;
        while (last + 1 < numbers.size() && numbers[last + 1] == numbers[last] + 1) {
            ++last;
        }
        text +=
            String::format(last > i ? "%s%d-%d" : "%s%d", text.empty() ? "" : " ", numbers[i], numbers[last]);
        i = last + 1;
    }
    if (!text.empty()) {
        settings.setString(kTakenEditsKey, text);
    } else if (settings.contains(kTakenEditsKey)) {
        settings.remove(kTakenEditsKey);
    }
}

} // namespace Qx::detail
