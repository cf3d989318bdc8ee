#include "platform/base/id_stamp.h"

#include <atomic>
#include <pthread.h>
#include <random>

namespace {

/// Counts forks of the process: a child must not go on with the prefixes it inherited.
std::atomic<uint32_t> forkCount{0};

struct Generator {
    uint32_t first = 0;
    uint32_t second = 0;
    uint32_t counter = 0;
    uint32_t bornAtFork = 0;
    bool seeded = false;

    void seed() {
        static const int watched = pthread_atfork(nullptr, nullptr, [] { ++forkCount; });
        static_cast<void>(watched);
        std::random_device source;
        first = source() & 0x3FFFFFFFu;
        second = source();
        counter = 0;
        bornAtFork = forkCount.load(std::memory_order_relaxed);
        seeded = true;
    }

    IdStamp next(IdStampMagic::MagicType type) {
        if (!seeded || bornAtFork != forkCount.load(std::memory_order_relaxed) || counter == UINT32_MAX) {
            seed();
        }
        IdStamp stamp(first, second, ++counter);
        stamp.setMagicType(type);
        return stamp;
    }
};

thread_local Generator generator;

/// Three words of eight digits and what separates them.
constexpr size_t kTextSize = sizeof(IdStamp::Text);

void writeHex(char* to, uint32_t word) {
    for (int i = 7; i >= 0; --i) {
        to[i] = "0123456789abcdef"[word & 0xF];
        word >>= 4;
    }
}

bool readHex(std::string_view digits, uint32_t& word) {
    word = 0;
    for (const char c : digits) {
        uint32_t value = 0;
        if (c >= '0' && c <= '9') {
            value = static_cast<uint32_t>(c - '0');
        } else if (c >= 'a' && c <= 'f') {
            value = static_cast<uint32_t>(c - 'a') + 10;
        } else if (c >= 'A' && c <= 'F') {
            value = static_cast<uint32_t>(c - 'A') + 10;
        } else {
            return false;
        }
        word = word << 4 | value;
    }
    return true;
}

} // namespace

IdStamp::IdStamp(std::string_view text) {
    if (text.size() != kTextSize || text[8] != '-' || text[17] != '-') {
        return;
    }
    std::array<uint32_t, 3> words{};
    for (size_t i = 0; i < words.size(); ++i) {
        if (!readHex(text.substr(i * 9, 8), words[i])) {
            return;
        }
    }
    m_words = words;
}

IdStamp IdStamp::fresh(IdStampMagic::MagicType type) {
    return generator.next(type);
}

IdStamp::Text IdStamp::asText() const {
    Text text;
    writeHex(&text.letters[0], m_words[0]);
    text.letters[8] = '-';
    writeHex(&text.letters[9], m_words[1]);
    text.letters[17] = '-';
    writeHex(&text.letters[18], m_words[2]);
    return text;
}

String IdStamp::asString() const {
    return String(std::string_view(asText()));
}
