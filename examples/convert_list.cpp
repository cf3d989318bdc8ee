// Reads a cut list of another tool, cuts its first second off, and writes it as a list again: no project, no
// files of edits. Build it with find_package(quillmarch_edit REQUIRED COMPONENTS interchange) and link
// quillmarch::interchange.
//
//     convert_list IN.edl RATE OUT.edl

#include <cstdio>
#include <edit/model/cel.h>
#include <edit/model/edit.h>
#include <interchange/edl/edl_export.h>
#include <interchange/edl/edl_import.h>

int main(int argc, char** argv) {
    if (argc != 4) {
        std::fprintf(stderr, "usage: convert_list IN.edl RATE OUT.edl\n");
        return 2;
    }
    interchange::Import list;
    interchange::ImportOptions options;
    options.rate = Qx::FrameRate::fromString(argv[2]);
    if (const Qx::Status read = interchange::importEdl(argv[1], options, list); !read) {
        std::fprintf(stderr, "%s\n", read.reason().c_str());
        return 1;
    }

    Edit& edit = *list.sequence;
    Vector<int> chans;
    edit.getChans(chans);
    for (const int chan : chans) {
        edit.get_edit_cel_p(chan)->remove({0.0, 1.0});
    }

    // The shots are in memory, not in a project, so the writer is told where to look for them.
    interchange::EdlExportOptions how;
    how.source = [&list](const cookie& item) {
        for (const EditPtr& shot : list.shots) {
            if (shot->get_cookie() == item) {
                return shot;
            }
        }
        return EditPtr();
    };
    if (const Qx::Status written = interchange::exportEdlFile(edit, how, argv[3], list.report); !written) {
        std::fprintf(stderr, "%s\n", written.reason().c_str());
        return 1;
    }
    for (const String& line : list.report.lines()) {
        std::fprintf(stderr, "%s\n", line.c_str());
    }
    std::printf("%s: %zu sources, %.2f s\n", edit.getName().c_str(), list.shots.size(), edit.getEndTime());
    return 0;
}
