#pragma once

#include "platform/base/export.h"
#include "platform/base/num_range.h"

#include <cstddef>
#include <vector>

class PStream;

namespace Aud::DynamicLevelControl {

/// One node of a level envelope. 16 bytes in the file: the time, the level, 4 bytes of zero.
struct Node {
    double time = 0; ///< seconds of edit time
    float level = 1; ///< gain, 1 is unity
    bool operator==(const Node&) const = default;
};

/// A level envelope: nodes in strict order of time, linear between them, constant before the first and after
/// the last; 1 everywhere when empty. At most one node at a time (within the tolerance). A plain value.
///
/// The operations on ranges lay parts of envelopes one after the other. What was heard in a part is heard
/// where it comes to lie:
///
///     remove [2, 4)      insert [0, 1) of a store at level .5 at 2
///     1 __   __          1 __  ___
///         \_/            .5  |_|
///
/// Where two parts meet at one level there is one node; where they meet at different ones, the earlier level
/// holds until `kStep` before the joint and the later one from the joint on. An argument that is no usable
/// time, or a range no longer than the tolerance, changes nothing; so does laying an empty store into an
/// empty one.
class QM_API Store {
public:
    /// The greatest absolute time of a node, seconds.
    static constexpr double kGreatestTime = 1e9;
    /// Seconds that a sudden change of level takes: half a sample at 48 kHz.
    static constexpr double kStep = 1e-5;

    [[nodiscard]] size_t size() const { return m_nodes.size(); }
    [[nodiscard]] bool empty() const { return m_nodes.empty(); }
    [[nodiscard]] const Node& operator[](size_t i) const { return m_nodes[i]; }
    [[nodiscard]] const std::vector<Node>& nodes() const { return m_nodes; }

    /// Puts a node in its place; one that is there at the same time takes its level. Returns its position;
    /// `size()`, changing nothing, for a time or level that is no usable number.
    size_t insertNode(double time, float level);
    bool removeNode(size_t i);
    /// Moves a node. False, changing nothing, if it would reach or pass a neighbour.
    bool moveNode(size_t i, double time);
    bool setLevel(size_t i, float level);
    void clear() { m_nodes.clear(); }

    [[nodiscard]] double levelAt(double time) const;

    /// Takes the nodes out of a range and closes up; what follows moves earlier by its length. A node at each
    /// edge keeps the envelope elsewhere as it was.
    void remove(const NumRange<double, Ordered>& range);
    /// Opens up at `at` and lays the part of `source` there.
    void insert(const Store& source, const NumRange<double, Ordered>& sourceRange, double at);
    /// Overwrites from `at` with the part of `source`.
    void replace(const Store& source, const NumRange<double, Ordered>& sourceRange, double at);
    /// Drops nodes that lie on the line between their neighbours: no level changes by more than 1e-6.
    void simplify();

    void pack(PStream& stream) const;
    /// On a bad stream the stream is in its error state and the store is as it was.
    void unpack(PStream& stream);
    bool operator==(const Store&) const = default;

private:
    std::vector<Node> m_nodes;
};

} // namespace Aud::DynamicLevelControl
