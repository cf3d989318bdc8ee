#include "edit/project/cookie_allocator.h"

#include "edit/project/detail/project_files.h"
#include "platform/services/edit_filenames.h"
#include "platform/services/log.h"

#include <algorithm>
#include <iterator>

using namespace Qx::detail;

namespace {

/// Numbers of edits, ascending.
using Numbers = std::vector<int>;

void sortNumbers(Numbers& numbers) {
    std::sort(numbers.begin(), numbers.end());
    numbers.erase(std::unique(numbers.begin(), numbers.end()), numbers.end());
}

/// The number of an edit that can be handed out here; 0 for any other cookie.
int numberOf(const cookie& edit) {
    const bool counted = edit.is_valid() && edit.type() == Cookie_Type::Edit && edit.word(1) == 0 &&
                         edit.word(0) >= 1 && edit.word(0) <= static_cast<unsigned>(kLastEditNumber);
    return counted ? static_cast<int>(edit.word(0)) : 0;
}

/// True for what follows the cookie in the name of an edit file, or of what is kept beside one: its backups
/// and what was set aside.
bool endsEditName(std::string_view rest) {
    for (const std::string_view extension : {std::string_view(".ED2"), std::string_view(".ED3")}) {
        if (rest.starts_with(extension)) {
            return true;
        }
    }
    return rest.starts_with(std::string_view(getEditFilenameExt()));
}

/// Adds the edits that a folder's names tell of: in `folder` itself, files whatever they are (for no edit
/// could be stored in the place of a link or a folder), else, with `isMilestones`, a folder an edit. A folder
/// that is not there has none.
Qx::FileError addNamed(const String& folder, bool isMilestones, Numbers& taken) {
    if (isMilestones && Qx::askFile(folder).isMissing()) {
        return {};
    }
    std::vector<String> names;
    if (auto error = Qx::retryInterrupted([&] { return Qx::fileSystem().list(folder, names); })) {
        return error;
    }
    constexpr size_t kCookieLength = 8;
    for (const String& name : names) {
        const std::string_view text(name);
        if (text.size() < kCookieLength ||
            (isMilestones ? text.size() > kCookieLength : !endsEditName(text.substr(kCookieLength)))) {
            continue;
        }
        if (const int number = numberOf(cookie(text.substr(0, kCookieLength))); number != 0) {
            taken.push_back(number);
        }
    }
    return {};
}

Qx::Status listNamed(const String& folder, Numbers& named) {
    for (const bool isMilestones : {false, true}) {
        const String place = isMilestones ? Qx::joinPath(folder, kMilestonesFolder) : folder;
        if (auto error = addNamed(place, isMilestones, named)) {
            return error.status();
        }
    }
    sortNumbers(named);
    return {};
}

/// Where the choice of numbers stands.
struct Choice {
    int next = 1;
    int skipped = 0;
    std::vector<cookie> chosen;
};

/// Chooses `count` numbers from `next` on that are not taken, and moves `next` past them.
Qx::Status choose(const String& folder, unsigned count, const Numbers& taken, Choice& choice) {
    auto passed = std::lower_bound(taken.begin(), taken.end(), choice.next);
    for (; choice.chosen.size() < count; ++choice.next) {
        if (choice.next > kLastEditNumber) {
            return Qx::Status::failure(
                Qx::StatusCode::Full,
                folder + ": the numbers of the project's edits are used up; go on in a new project");
        }
        if (passed != taken.end() && *passed == choice.next) {
            ++passed;
            ++choice.skipped;
        } else {
            choice.chosen.emplace_back(Cookie_Type::Edit, choice.next, 0);
        }
    }
    return {};
}

/// Where to go on when nothing tells what was handed out: behind all that is named, as edits may play what
/// is there no more; from the start when there is no room behind it.
int startWithoutCount(const Numbers& named, unsigned count) {
    const int last = named.empty() ? 0 : named.back();
    return static_cast<unsigned>(kLastEditNumber - last) < count ? 1 : last + 1;
}

/// Advances the stored number of the next cookie, durably; numbers that are taken are remembered until it has
/// passed them.
Qx::Status update_cookie_number(const String& path, configb& settings, int next, Numbers taken) {
    settings.setInt(kNextEditKey, next);
    taken.erase(taken.begin(), std::lower_bound(taken.begin(), taken.end(), next));
    setTakenNumbers(settings, taken);
    return writeStore(path, settings);
}

} // namespace

CookieAllocator::CookieAllocator(String projectFolder) : m_folder(std::move(projectFolder)) {}

Qx::Status CookieAllocator::allocate(unsigned count, std::vector<cookie>& out,
                                     std::span<const cookie> taken) {
    if (m_folder.empty()) {
        return Qx::Status::failure(Qx::StatusCode::BadArgument,
                                   "there is no project folder to number edits in; open a project first");
    }
    if (count == 0 && taken.empty()) {
        return {};
    }
    Qx::FileLock lock(lockPath(m_folder));
    if (auto status = lock.take(); !status) {
        return status;
    }
    const String path = settingsPath(m_folder);
    configb settings = emptySettings();
    bool found = false;
    if (auto status = readStore(path, settings, found); !status) {
        return status;
    }
    Choice choice;
    Numbers reserved;
    Numbers named;
    auto status = readNextEditNumber(settings, path, choice.next);
    if (status) {
        status = readTakenNumbers(settings, path, reserved);
    }
    if (status) {
        status = listNamed(m_folder, named);
    }
    if (!status) {
        return status;
    }
    if (!settings.contains(kNextEditKey)) {
        const int start = startWithoutCount(named, count);
        choice.skipped = start == 1 ? 0 : static_cast<int>(named.size());
        choice.next = start;
    }
    std::transform(taken.begin(), taken.end(), std::back_inserter(reserved), numberOf);
    sortNumbers(reserved);
    Numbers all = named;
    all.insert(all.end(), reserved.begin(), reserved.end());
    sortNumbers(all);
    if (status = choose(m_folder, count, all, choice); !status) {
        return status;
    }
    if (status = update_cookie_number(path, settings, choice.next, std::move(reserved)); !status) {
        return status;
    }
    lock.release();
    if (choice.skipped > 0) {
        herc_printf("new_edit() Skipped %d pre-existing cookies\n", choice.skipped);
    }
    out.insert(out.end(), choice.chosen.begin(), choice.chosen.end());
    return {};
}

cookie CookieAllocator::allocateOne(std::span<const cookie> taken) {
    std::vector<cookie> chosen;
    if (auto status = allocate(1, chosen, taken); !status) {
        herc_printf("CookieAllocator::allocateOne: %s\n", status.reason().c_str());
        return invalid_cookie;
    }
    return chosen.front();
}
