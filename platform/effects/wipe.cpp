#include "platform/effects/wipe.h"

#include <algorithm>

namespace {

using Wipe::Patterns::Info;
using Wipe::Patterns::Pattern;

constexpr Info row(uint32_t code, std::string_view name) {
    return {static_cast<Pattern>(code), name};
}

constexpr Info kInfo[] = {
    row(1, "bar left to right"),
    row(2, "bar top to bottom"),
    row(3, "box top left"),
    row(4, "box top right"),
    row(5, "box bottom right"),
    row(6, "box bottom left"),
    row(7, "four boxes corners in"),
    row(8, "four boxes corners out"),
    row(21, "barn door vertical"),
    row(22, "barn door horizontal"),
    row(23, "box top centre"),
    row(24, "box right centre"),
    row(25, "box bottom centre"),
    row(26, "box left centre"),
    row(41, "diagonal top left"),
    row(42, "diagonal top right"),
    row(43, "bow tie vertical"),
    row(44, "bow tie horizontal"),
    row(45, "barn door diagonal bottom left"),
    row(46, "barn door diagonal top left"),
    row(47, "double barn door"),
    row(48, "double diamond"),
    row(61, "vee down"),
    row(62, "vee left"),
    row(63, "vee up"),
    row(64, "vee right"),
    row(65, "barn vee down"),
    row(66, "barn vee left"),
    row(67, "barn vee up"),
    row(68, "barn vee right"),
    row(71, "zigzag left to right"),
    row(72, "zigzag top to bottom"),
    row(73, "barn zigzag vertical"),
    row(74, "barn zigzag horizontal"),
    row(101, "iris rectangle"),
    row(102, "iris diamond"),
    row(103, "triangle up"),
    row(104, "triangle right"),
    row(105, "triangle down"),
    row(106, "triangle left"),
    row(107, "arrow head up"),
    row(108, "arrow head right"),
    row(109, "arrow head down"),
    row(110, "arrow head left"),
    row(111, "pentagon up"),
    row(112, "pentagon down"),
    row(113, "hexagon horizontal"),
    row(114, "hexagon vertical"),
    row(119, "circle"),
    row(120, "ellipse horizontal"),
    row(121, "ellipse vertical"),
    row(122, "eye horizontal"),
    row(123, "eye vertical"),
    row(124, "round rectangle horizontal"),
    row(125, "round rectangle vertical"),
    row(127, "star of four points"),
    row(128, "star of five points"),
    row(129, "star of six points"),
    row(130, "heart"),
    row(131, "keyhole"),
    row(201, "clock from twelve"),
    row(202, "clock from three"),
    row(203, "clock from six"),
    row(204, "clock from nine"),
    row(205, "pinwheel two blades vertical"),
    row(206, "pinwheel two blades horizontal"),
    row(207, "pinwheel four blades"),
    row(211, "fan centre top"),
    row(212, "fan centre right"),
    row(213, "double fan out vertical"),
    row(214, "double fan out horizontal"),
    row(221, "single sweep clockwise top"),
    row(222, "single sweep clockwise right"),
    row(223, "single sweep clockwise bottom"),
    row(224, "single sweep clockwise left"),
    row(225, "double sweep parallel vertical"),
    row(226, "double sweep parallel diagonal"),
    row(227, "double sweep opposite vertical"),
    row(228, "double sweep opposite horizontal"),
    row(231, "fan top"),
    row(232, "fan right"),
    row(233, "fan bottom"),
    row(234, "fan left"),
    row(235, "double fan in vertical"),
    row(236, "double fan in horizontal"),
    row(241, "single sweep clockwise top left"),
    row(242, "single sweep counter-clockwise bottom left"),
    row(243, "single sweep clockwise bottom right"),
    row(244, "single sweep counter-clockwise top right"),
    row(245, "double sweep parallel diagonal top left"),
    row(246, "double sweep parallel diagonal bottom left"),
    row(251, "saloon door top"),
    row(252, "saloon door left"),
    row(253, "saloon door bottom"),
    row(254, "saloon door right"),
    row(261, "windshield right"),
    row(262, "windshield up"),
    row(263, "windshield vertical"),
    row(264, "windshield horizontal"),
    row(301, "snake top left horizontal"),
    row(302, "snake top left vertical"),
    row(303, "snake diagonal top left"),
    row(304, "snake diagonal top right"),
    row(305, "snake diagonal bottom right"),
    row(306, "snake diagonal bottom left"),
    row(310, "spiral clockwise top left"),
    row(311, "spiral clockwise top right"),
    row(312, "spiral clockwise bottom right"),
    row(313, "spiral clockwise bottom left"),
    row(314, "spiral counter-clockwise top left"),
    row(315, "spiral counter-clockwise bottom left"),
    row(316, "spiral counter-clockwise bottom right"),
    row(317, "spiral counter-clockwise top right"),
    row(320, "parallel snakes vertical top"),
    row(321, "parallel snakes vertical bottom"),
    row(322, "parallel snakes vertical top left opposite"),
    row(323, "parallel snakes vertical bottom left opposite"),
    row(324, "parallel snakes horizontal left"),
    row(325, "parallel snakes horizontal right"),
    row(326, "parallel snakes horizontal top left opposite"),
    row(327, "parallel snakes horizontal top right opposite"),
    row(328, "parallel snakes diagonal bottom left opposite"),
    row(329, "parallel snakes diagonal top left opposite"),
    row(340, "box snakes two top"),
    row(341, "box snakes two bottom"),
    row(342, "box snakes two left"),
    row(343, "box snakes two right"),
    row(344, "box snakes four vertical"),
    row(345, "box snakes four horizontal"),
    row(350, "waterfall vertical left"),
    row(351, "waterfall vertical right"),
    row(352, "waterfall horizontal left"),
    row(353, "waterfall horizontal right"),
};

static_assert(std::is_sorted(std::begin(kInfo), std::end(kInfo),
                             [](const Info& a, const Info& b) { return a.code < b.code; }),
              "patterns are found by bisection");

const Info* find(uint32_t code) {
    const auto found = std::lower_bound(std::begin(kInfo), std::end(kInfo), code,
                                        [](const Info& info, uint32_t its) { return info.code < its; });
    return found != std::end(kInfo) && found->code == code ? found : nullptr;
}

} // namespace

std::span<const Wipe::Patterns::Info> Wipe::Patterns::all() {
    return kInfo;
}

std::string_view Wipe::Patterns::name(Pattern pattern) {
    const Info* const info = find(pattern);
    return info != nullptr ? info->name : std::string_view();
}

bool Wipe::Patterns::isKnown(uint32_t code) {
    return find(code) != nullptr;
}

Wipe::Patterns::Pattern Wipe::remapPattern(WipePattern pattern, Wipe_Direction* direction) {
    if (direction != nullptr) {
        *direction = Wipe_Direction::Forward;
    }
    const Patterns::Info* const info = find(static_cast<uint32_t>(pattern));
    return info != nullptr ? info->code : Patterns::BarLeftToRight;
}
