#include "edit/graph/edit_graph_iterator_state.h"

#include "edit/graph/edit_graph_iterator.h"
#include "edit/model/edit.h"

#include <array>
#include <charconv>

namespace {

/// The number that a text begins with, whatever follows; 0 for none.
template <typename Number>
Number leadingNumber(std::string_view text) {
    if (text.starts_with('+')) {
        text.remove_prefix(1);
    }
    Number value{};
    return std::from_chars(text.data(), text.data() + text.size(), value).ec == std::errc() ? value
                                                                                            : Number{};
}

} // namespace

EditGraphIteratorState::EditGraphIteratorState(const EditGraphIterator& position)
    : time(position.getTime()), flags(position.getIterationFlags()) {
    const EditPtr root = position.getEditH();
    if (!root.valid()) {
        return;
    }
    edit = root->get_cookie();
    id = position.getNodeId(-1);
    if (!id.valid() || id.getMagicType() == IdStampMagic::ChannelNode) {
        id = position.getChanId(-1);
    }
}

EditGraphIteratorState::EditGraphIteratorState(const String& text) {
    std::array<std::string_view, 4> fields;
    size_t count = 0;
    std::string_view rest = text;
    for (;;) {
        rest.remove_prefix(std::min(rest.find_first_not_of(' '), rest.size()));
        if (rest.empty()) {
            break;
        }
        if (count == fields.size()) {
            return;
        }
        fields[count] = rest.substr(0, rest.find(' '));
        rest.remove_prefix(fields[count++].size());
    }
    if (count == fields.size()) {
        edit = cookie(fields[0]);
        id = IdStamp(fields[1]);
        time = leadingNumber<double>(fields[2]);
        flags = leadingNumber<int>(fields[3]);
    }
}

String EditGraphIteratorState::asString() const {
    return edit.asString() + " " + id.asString() + " " + Qx::doubleToText(time) + " " + std::to_string(flags);
}

String EditGraphIterator::asString() const {
    const EditGraphIteratorState state(*this);
    const bool isZero = (state.edit.word(0) | state.edit.word(1) | state.edit.word(2)) == 0;
    return state.edit.is_valid() && !isZero ? state.asString() : String();
}

/// To the position that a state names, sought from each root of the graph; to the node by itself where it hangs on
/// none.
void EditGraphIterator::restore(const EditGraphIteratorState& state) {
    m_rootEdit = state.valid() ? EditPtr(state.edit, eOpenExisting) : EditPtr();
    if (!m_rootEdit.valid()) {
        return;
    }
    const bool isChannel = state.id.getMagicType() == IdStampMagic::Channel;
    if (isChannel) {
        init(state.id);
        if (m_current >= 0) {
            return;
        }
    }
    Vector<IdStamp> roots;
    findAllRootNodeChans(m_rootEdit, m_time, roots);
    for (const IdStamp& root : roots) {
        init(root);
        if (search(state.id, isChannel ? ChanId : NodeId)) {
            return;
        }
    }
    if (isChannel) {
        init(state.id);
        return;
    }
    *this = EditGraphIterator(m_rootEdit, m_time, m_rootEdit->openObject(state.id), Extents(m_time, m_time),
                              getIterationFlags());
    if (m_current < 0) {
        invalidate();
    }
}
