#include "edit/graph/hier_handle.h"

#include "edit/model/edit.h"
#include "platform/base/ole_splat.h"

#include <mutex>
#include <vector>

namespace {

/// The channel of a nested edit that stands in for a cel, by the cel's name.
int nestedChannel(const Edit& edit, const String& name) {
    const Edit_Chan_Type type = name.empty() ? NoChan : Edit::edit_chan_type_from_name(name.front());
    int number = 1;
    if ((type != AudioChan && type != VideoChan) ||
        !Qx::textToInt(std::string_view(name).substr(1), number) || number < 1) {
        return edit.getFirstChan(VideoChan, Edit_Chan_SubType::NONE);
    }
    int chan = kBeforeFirstChan;
    for (int i = 0; i < number && chan != NO_CHAN; ++i) {
        edit.getNextChan(chan, type, Edit_Chan_SubType::NONE);
    }
    return chan;
}

/// Keeps a cel until the process ends.
void keepForGood(std::shared_ptr<cel> kept) {
    static std::mutex& mutex = *new std::mutex;
    static auto& all = *new std::vector<std::shared_ptr<cel>>;
    const std::lock_guard hold(mutex);
    all.push_back(std::move(kept));
}

} // namespace

cel* get_sub_cel(EditPtr& edit, const ce_handle& event) {
    const cookie strip = event.get_strip_cookie();
    if (event.valid() == 0 || !strip.is_valid() || strip.isMagic()) {
        return nullptr;
    }
    EditPtr opened(strip, eOpenExisting);
    if (!opened.valid() || !opened->isEdit()) {
        return nullptr;
    }
    cel* const content =
        opened->get_edit_cel_p(nestedChannel(*opened, event.get_its_cel()->editChannelName()));
    if (content != nullptr) {
        edit = opened;
    }
    return content;
}

cookie sub_handle(ce_handle& out, const ce_handle& event, bool) {
    out = ce_handle();
    EditPtr edit;
    const cel* const content = get_sub_cel(edit, event);
    if (content == nullptr) {
        return invalid_cookie;
    }
    const ce_handle in = event.matching_in_ceh();
    const ce_handle end = event.matching_out_ceh();
    std::unique_ptr<cel> copy = content->rescale(
        in.get_edit_time(), end.get_edit_time(), in.get_strip_time(), end.get_strip_time(),
        static_cast<double>(in.get_strip_level()), static_cast<double>(end.get_strip_level()), 0);
    if (copy == nullptr || copy->numEvents() == 0) {
        return invalid_cookie;
    }
    copy->editChannelInfo(event.get_its_cel()->editChannelName(), IdStamp(), String(), String());
    out = copy.release()->get_start_ceh();
    return edit->get_cookie();
}

hier_handle::hier_handle(cel* top, const cookie& edit) : m_depth(0), m_rootCel(top) {
    current().edit = edit;
    if (top != nullptr) {
        current().event = top->get_start_ceh();
    }
}

hier_handle::~hier_handle() {
    for (int popped = 0; popped < m_depth; ++popped) {
        popd();
    }
    for (; m_depth > 0; --m_depth) {
        if (current().owned != nullptr) {
            keepForGood(std::move(current().owned));
        }
    }
}

ce_handle hier_handle::get() const {
    return m_depth < 0 ? ce_handle() : m_levels[static_cast<size_t>(m_depth)].event;
}

cookie hier_handle::getEditCookie() const {
    return m_depth < 0 ? cookie() : m_levels[static_cast<size_t>(m_depth)].edit;
}

void hier_handle::push(const cookie& edit, const ce_handle& event) {
    // The top cel is the caller's; those of deeper levels are this handle's.
    std::shared_ptr<cel> owned(m_depth >= 0 ? event.get_its_cel() : nullptr);
    if (m_depth + 1 >= kMaxDepth) {
        ole_splat("hier_handle::push: depth max exceeded");
    }
    if (m_depth == kMaxDepth) {
        return;
    }
    ++m_depth;
    current() = Level{edit, event, std::move(owned)};
    if (m_depth == 0) {
        m_rootCel = event.get_its_cel();
    }
}

void hier_handle::popd() {
    if (m_depth < 0) {
        ole_splat("hier_handle::pop: to many pops");
        return;
    }
    current() = Level();
    --m_depth;
}

void hier_handle::drill(const ce_handle& event) {
    ce_handle from = event;
    while (m_depth >= 0) {
        if (m_depth == kMaxDepth) {
            ole_splat("hier_handle::find_aux: Edit too deep");
            return;
        }
        ce_handle start;
        const cookie nested = sub_handle(start, from);
        if (!nested.is_valid()) {
            return;
        }
        push(nested, start);
        from = start;
    }
}

void hier_handle::find(double time, ce_info kind) {
    while (m_depth > 0 && !current().event.time_in_range_exclusive(time)) {
        popd();
    }
    if (m_depth < 0 || m_rootCel == nullptr) {
        return;
    }
    ce_handle found = m_rootCel->find_ceh(time, kind);
    if (m_depth > 0) {
        static_cast<void>(current().event.find_ceh(found, time, kind));
    }
    current().event = found;
    if (found.valid() != 0) {
        find_aux(time, kind);
    }
}

void hier_handle::find_aux(double time, ce_info kind) {
    while (m_depth >= 0) {
        if (m_depth == kMaxDepth) {
            ole_splat("hier_handle::find_aux: Edit too deep");
            return;
        }
        ce_handle start;
        const cookie nested = sub_handle(start, current().event);
        if (!nested.is_valid()) {
            return;
        }
        cel* const content = start.get_its_cel();
        if (time > content->get_end_time()) {
            delete content;
            return;
        }
        const ce_handle found = content->find_ceh(time, kind);
        push(nested, ce_handle(content, found.index()));
        if (found.valid() == 0) {
            return;
        }
    }
}

void hier_handle::walk_hier(int type, ce_info kind) {
    if ((type != kNext && type != kPrevious) || m_depth < 0) {
        return;
    }
    const bool forward = type == kNext;
    while (current().event.valid() != 0) {
        ce_handle& event = current().event;
        event = forward ? event.get_next_ceh(kind) : event.get_prev_ceh(kind);
        if (event.valid() != 0) {
            ce_handle start;
            const cookie nested = sub_handle(start, event);
            if (nested.is_valid()) {
                const ce_handle entry = forward ? start : start.get_end_ceh();
                push(nested, entry);
                drill(entry);
            }
            return;
        }
        if (m_depth == 0) {
            return;
        }
        popd();
        ce_handle& outer = current().event;
        outer = forward ? outer.matching_out_ceh() : outer.matching_in_ceh();
    }
}
