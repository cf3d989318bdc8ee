// Makes a project with an edit of two clips, cuts a second out of it, and takes the cut back. Build it with
// find_package(quillmarch_edit REQUIRED) and link quillmarch::edit.
//
//     make_and_cut FOLDER

#include <cstdio>
#include <edit/editing/editor.h>
#include <edit/manager/session.h>
#include <edit/model/cel.h>

namespace {

int tell(const Qx::Status& status) {
    std::fprintf(stderr, "%s\n", status.reason().c_str());
    return 1;
}

/// A new edit of the open project with two clips of four seconds, picture and sound.
EditPtr makeEdit() {
    EditPtr edit(edit_manager::new_edit(), eOpenOrCreate);
    if (edit.valid()) {
        edit->setName("Rushes");
        edit->addChan(AudioChan); // beside the one for the picture, which it has
        Vector<int> chans;
        edit->getChans(chans);
        const cookie tape("E0009000"); // what the clips play
        for (const int chan : chans) {
            edit->get_edit_cel_p(chan)->appendEventPair(tape, 36000.0, 0.0, 4.0);
            edit->get_edit_cel_p(chan)->appendEventPair(tape, 36100.0, 4.0, 4.0);
        }
        edit->setChangeDescription(kEventsChanged, true);
    }
    return edit;
}

} // namespace

int main(int argc, char** argv) {
    if (argc != 2) {
        std::fprintf(stderr, "usage: make_and_cut FOLDER\n");
        return 2;
    }
    Session session(argv[1]);
    if (const Qx::Status opened = session.open(); !opened) {
        return tell(opened);
    }

    EditPtr edit = makeEdit();
    if (!edit.valid()) {
        return tell(Qx::Status::failure("no edit could be made"));
    }
    const cookie item = edit->get_cookie();
    std::printf("%s: %.2f s\n", edit->getName().c_str(), edit->getEndTime());

    EditModule place(edit);
    place.markAllAt(EditModule::Range(3.5, 4.5));
    const Editor::Result cut = Editor::apply(EditModule(), place, edit_operation::Remove);
    if (!cut.valid()) {
        return tell(Qx::Status::failure(cut.reason()));
    }
    std::printf("cut: %.2f s\n", edit->getEndTime());

    if (!edit_manager::undoRequest(item)) {
        return tell(Qx::Status::failure("nothing could be undone"));
    }
    const EditPtr before = edit; // the state that was undone; changes to it are not written
    OpenReport report;
    edit = edit_manager::openEdit(item, eOpenExisting, report);
    if (!edit.valid()) {
        return tell(report.status);
    }
    std::printf("undone: %.2f s, and the old handle still says %.2f s\n", edit->getEndTime(),
                before->getEndTime());

    if (const Qx::Status closed = session.close(); !closed) {
        return tell(closed);
    }
    std::printf("written as %s\n", item.asString().c_str());
    return 0;
}
