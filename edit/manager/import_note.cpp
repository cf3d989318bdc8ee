#include "edit/manager/import_note.h"

#include "platform/services/atomic_batch.h"
#include "platform/services/atomic_file.h"
#include "platform/services/edit_filenames.h"

#include <algorithm>

namespace {

/// The first line and the names are in files: do not change them.
constexpr const char* kFirstLine = "Quillmarch import 1";
constexpr const char* kNameStart = "Import.";
constexpr const char* kNameEnd = ".pending";
constexpr uint64_t kSizeLimit = uint64_t{64} << 20;

String fileOf(const String& folder, const cookie& item) {
    return Qx::joinPath(folder, item.asString() + getEditFilenameExt());
}

/// The edits that a note names; none for a text that is no whole note.
std::vector<cookie> editsOf(const String& text) {
    const std::vector<String> lines = text.split('\n', true);
    std::vector<cookie> edits;
    if (lines.empty() || lines.front() != kFirstLine) {
        return {};
    }
    for (size_t i = 1; i < lines.size(); ++i) {
        edits.emplace_back(std::string_view(lines[i]));
        if (!edits.back().isStorable()) {
            return {};
        }
    }
    return edits;
}

/// True if an edit file, backup or file set aside has the name of the item.
bool isThere(const std::vector<String>& names, const cookie& item) {
    const String start = item.asString() + getEditFilenameExt();
    const auto place = std::lower_bound(names.begin(), names.end(), start);
    return place != names.end() && place->starts_with(start);
}

/// Fills in what is left of the import of which `import.note` tells. A failure when that is not known.
Qx::Status examine(const String& folder, const std::vector<String>& names, UnfinishedImport& import) {
    const Qx::FileAnswer written = Qx::askFile(import.note);
    if (written.isUnknown()) {
        return written.obstacle().status();
    }
    String text;
    if (written.isRegular()) {
        const Qx::FileError error = Qx::readWholeFile(import.note, text, kSizeLimit);
        // It may have come to its end meanwhile.
        if (error && !Qx::askFile(import.note).isMissing()) {
            return error.status();
        }
    }
    std::vector<cookie> edits = editsOf(text);
    if (edits.empty() || isThere(names, edits.back())) {
        return {};
    }
    edits.pop_back();
    for (const cookie& shot : edits) {
        const String path = fileOf(folder, shot);
        const Qx::FileAnswer found = Qx::askFile(path);
        if (found.isUnknown()) {
            return found.obstacle().status();
        }
        if (found.isRegular() && found.info().modifiedNs <= written.info().modifiedNs) {
            import.files.push_back(path);
        }
    }
    for (const String& name : names) {
        if (name.find(getEditFilenameExt()) != String::npos && !Qx::isTemporaryName(name)) {
            const Qx::FileAnswer found = Qx::askFile(Qx::joinPath(folder, name));
            import.mayBePlayed = import.mayBePlayed || found.isUnknown() ||
                                 (found.isRegular() && found.info().modifiedNs > written.info().modifiedNs);
        }
    }
    return {};
}

} // namespace

Qx::Status writeImportNote(const String& folder, const std::vector<cookie>& edits, String& path) {
    path = Qx::joinPath(folder, kNameStart + edits.back().asString() + kNameEnd);
    String text = kFirstLine;
    for (const cookie& item : edits) {
        text += "\n" + item.asString();
    }
    const Qx::AtomicBatch::Pause atOnce;
    Qx::AtomicFile file(path);
    Qx::FileError error = file.write(text + "\n");
    if (!error) {
        error = file.commit();
    }
    return error.status();
}

Qx::Status unfinishedImports(const String& folder, std::vector<UnfinishedImport>& imports) {
    std::vector<String> names;
    Qx::Status status = Qx::retryInterrupted([&] { return Qx::fileSystem().list(folder, names); }).status();
    for (auto name = std::lower_bound(names.begin(), names.end(), kNameStart);
         name != names.end() && name->starts_with(kNameStart); ++name) {
        if (!name->ends_with(kNameEnd)) {
            continue;
        }
        UnfinishedImport import;
        import.note = Qx::joinPath(folder, *name);
        if (Qx::Status examined = examine(folder, names, import)) {
            imports.push_back(std::move(import));
        } else {
            status = examined;
        }
    }
    return status;
}

size_t takeBackImport(const UnfinishedImport& import) {
    size_t removed = 0;
    for (const String& file : import.files) {
        const Qx::FileError error = Qx::retryInterrupted([&] { return Qx::fileSystem().remove(file); });
        removed += error ? 0 : 1;
    }
    if (removed == import.files.size()) {
        const Qx::FileError error =
            Qx::retryInterrupted([&] { return Qx::fileSystem().remove(import.note); });
        static_cast<void>(error);
    }
    return removed;
}
