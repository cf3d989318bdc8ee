#pragma once

#include "platform/services/files.h"
#include "platform/store/tag_bag.h"
#include "support/temporary_folder.h"

#include <gtest/gtest.h>
#include <memory>
#include <vector>

namespace test {

/// A list of numbers that counts how often it was packed.
class Numbers : public Streamable {
public:
    explicit Numbers(std::vector<uint32_t> list = {}) : values(std::move(list)) {}

    [[nodiscard]] const char* layerName() const override { return "Numbers"; }
    [[nodiscard]] const char* shortLayerName() const override { return "N"; }
    [[nodiscard]] uint8_t revisionMajor() const override { return major; }
    [[nodiscard]] uint8_t revisionMinor() const override { return minor; }
    void revisionMajor(uint8_t value) override { major = value; }
    void revisionMinor(uint8_t value) override { minor = value; }
    void pack(PStream& stream) const override {
        ++timesPacked;
        stream.setUnsignedLong(static_cast<uint32_t>(values.size()));
        stream.setRaw(values.data(), values.size() * sizeof(uint32_t));
    }
    void unpack(PStream& stream) override {
        std::vector<uint32_t> read(stream.getCount(sizeof(uint32_t)));
        if (stream.getRaw(read.data(), read.size() * sizeof(uint32_t))) {
            values = std::move(read);
        }
    }
    [[nodiscard]] std::unique_ptr<Streamable> clone(BuilderType) const override {
        ADD_FAILURE() << "a save clones nothing";
        return nullptr;
    }

    static void know() {
        registerBuilder("Numbers",
                        []() -> std::unique_ptr<Streamable> { return std::make_unique<Numbers>(); });
    }

    std::vector<uint32_t> values;
    uint8_t major = 2;
    uint8_t minor = 3;
    mutable int timesPacked = 0;
};

/// A class that has no builder, as of a newer program.
class Stranger : public Numbers {
public:
    using Numbers::Numbers;
    [[nodiscard]] const char* layerName() const override { return "Stranger"; }
};

inline std::unique_ptr<Numbers> numbers(std::vector<uint32_t> values) {
    return std::make_unique<Numbers>(std::move(values));
}

class StoreTest : public ::testing::Test {
protected:
    void SetUp() override { Numbers::know(); }

    TagBag::OpenResult open(TagBag& bag, eEditOpenBehaviour behaviour = eOpenExisting) {
        return bag.open(item, folder.path(), behaviour, ".qme");
    }
    /// Writes a small store: two lists, and between them one of a class that is not known.
    void writeSmall() {
        TagBag bag;
        ASSERT_EQ(open(bag, eOpenNew), TagBag::NewStore);
        bag.storeObject("first", numbers({1, 2, 3}));
        bag.storeObject("strange", std::make_unique<Stranger>(std::vector<uint32_t>{7}));
        bag.storeObject("last", numbers({4, 5}));
        const Qx::Status status = bag.flush();
        ASSERT_TRUE(status) << status.reason();
    }
    [[nodiscard]] std::string bytes() const { return bytes(name); }
    /// A file's bytes; "(missing)" when it cannot be read.
    [[nodiscard]] std::string bytes(const String& file) const {
        String content;
        return Qx::readWholeFile(folder.path(file), content, UINT32_MAX) ? "(missing)" : content;
    }
    void write(const std::string& content) { folder.write(name, content); }
    static std::vector<uint32_t> valuesOf(TagBag& bag, const char* object) {
        const auto* found = dynamic_cast<Numbers*>(bag.openObject(object));
        return found != nullptr ? found->values : std::vector<uint32_t>{};
    }

    TemporaryFolder folder;
    const cookie item{Cookie_Type::Edit, 1, 2};
    const String name = item.asString() + ".qme";
};

} // namespace test
