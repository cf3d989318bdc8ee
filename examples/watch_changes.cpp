// Changes an edit, undoes the last change, and prints what a listener hears of it. Build it with
// find_package(quillmarch_edit REQUIRED) and link quillmarch::edit.
//
//     watch_changes FOLDER

#include <cstdio>
#include <edit/manager/session.h>

namespace {

void hear(const EditModification& change) {
    std::printf("heard: %s%s\n", change.inverted() ? "undone: " : "", change.name());
}

} // namespace

int main(int argc, char** argv) {
    if (argc != 2) {
        std::fprintf(stderr, "usage: watch_changes FOLDER\n");
        return 2;
    }
    Session session(argv[1]);
    if (const Qx::Status opened = session.open(); !opened) {
        std::fprintf(stderr, "%s\n", opened.reason().c_str());
        return 1;
    }
    session.listen(edit_manager::invalidateCacheMsgType(), [](const NotifyMsg& message) {
        std::printf("heard: handles of %s are of an old state\n", message.text().c_str());
    });
    EditPtr edit(edit_manager::new_edit(), eOpenOrCreate);
    if (!edit.valid()) {
        return 1;
    }
    session.follow(edit, hear);

    const cookie item = edit->get_cookie();
    edit->setName("First");
    if (!edit_manager::backup_edit(item)) {
        return 1;
    }
    edit->setName("Second");
    if (!edit_manager::undoRequest(item)) {
        return 1;
    }

    edit = edit_manager::openEdit(item, eOpenExisting);
    if (!edit.valid()) {
        return 1;
    }
    session.follow(edit, hear); // another object than the one that was followed so far
    std::printf("its name is %s again\n", edit->getName().c_str());
    edit->setName("Third");

    Vector<UnwrittenEdit> unwritten;
    if (const Qx::Status closed = session.close(unwritten); !closed) {
        if (closed.code() == Qx::StatusCode::Full) {
            std::fprintf(stderr, "make room, and close the project again\n");
        }
        std::fprintf(stderr, "%s\n", closed.reason().c_str());
        return 1;
    }
    return 0;
}
