// The bit stream against a model that moves single bits and works piece by piece.
#include "Varnek_CBitInputStream.h"

#include <algorithm>
#include <functional>
#include <memory>
#include <new>
#include <random>

#include "support/VarnekTest.h"

namespace {

using ::testing::ElementsAre;
using ::testing::IsEmpty;

// The same operations, bit by bit.
struct Model {
    std::vector<unsigned char> bytes;
    int size = static_cast<int>(bytes.size());
    int index = 0;
    int consumed = 0;  // as counted; a rewind from inside a byte makes it differ from what is taken
    int taken = 0;
    bool end = false;
    std::vector<std::string> log = {};

    int64_t Fail(const std::string &line, unsigned char &flag) {
        flag = 0;
        if (!line.empty()) {
            log.push_back("BIS: GetBits" + line + "\n");
        }
        return 0;
    }
    int64_t GetBits(int num, unsigned char &flag) {
        const std::string text = "aNum=[" + std::to_string(num) + "]";
        if (num > 8 - consumed) {
            const std::string bit = std::to_string(consumed);
            return Fail(" Warning: " + text + ", iBitIdxInCurByte=[" + bit + "]", flag);
        }
        if (end || num < 0) {
            return Fail(end ? " Warning: End of Stream!" : ". Wrong bits number! " + text, flag);
        }
        int64_t value = 0;
        for (int i = 0; i < num; ++i, ++consumed) {
            value = value * 2 + (bytes[static_cast<size_t>(index)] >> (7 - taken++) & 1);
        }
        end = consumed == 8 && index == size - 1;
        if (consumed == 8 && !end) {
            ++index;
            consumed = taken = 0;
        }
        return value;
    }
    int64_t Pieces(int count, unsigned char &flag) {
        int piece = std::min(count, 8 - consumed);
        int64_t value = GetBits(piece, flag);
        for (count -= piece; count > 0; count -= piece) {
            piece = std::min(count, 8);
            value = value << piece | GetBits(piece, flag);
        }
        return value;
    }
    int64_t Read(int count, int largest, unsigned char &flag) {
        return count < 0 || count > largest || end ? Fail("", flag) : Pieces(count, flag);
    }
    int64_t ReadBit(unsigned char &flag) { return Read(1, 1, flag); }
    int64_t ReadByte(int count, unsigned char &flag) { return Read(count, 8, flag); }
    int64_t ReadShort(int count, unsigned char &flag) { return Read(count, 16, flag); }
    int64_t ReadInt(int count, unsigned char &flag) { return Read(count, 32, flag); }
    void Skip(int count) {
        unsigned char flag;
        count == 0 || end ? 0 : Pieces(count, flag);
    }
    int GetByteArray(unsigned char *dest, int count) {
        if (end || consumed != 0 || count < 0 || count > size - index) {
            return end ? -22 : consumed != 0 ? -1 : -10;
        }
        std::copy_n(bytes.begin() + index, count, dest);
        index += count;
        end = index == size;
        return 0;
    }
    int RewindBytes(int count) {
        const int target = (end ? size : index) - count;
        if (target >= 0 && target < size) {
            consumed = end ? 0 : consumed;
            index = target;
            taken = 0;
            end = false;
        }
        return 0;
    }
    int RwindToFirst() { return index = consumed = taken = end = 0; }
};

class BitInputStream : public VarnekTest {};

TEST_F(BitInputStream, BehavesLikeTheModel) {
    std::mt19937 random(20070212);
    const auto pick = [&random](int low, int high) { return std::uniform_int_distribution<int>(low, high)(random); };
    for (int round = 0; round < 600; ++round) {
        std::vector<unsigned char> bytes(static_cast<size_t>(pick(1, 14)));
        std::generate(bytes.begin(), bytes.end(), random);
        VarnekCBitInputStream stream(bytes.data(), static_cast<unsigned int>(bytes.size()),
                                     static_cast<unsigned char>(pick(0, 2)));
        Model model{bytes};
        for (int step = 0; step < 60; ++step) {
            const int operation = pick(0, 20) == 0 ? 8 : pick(0, 7);
            const int count = pick(0, 9) == 0 ? pick(-3, 40) : pick(0, 12);
            const auto apply = [=](auto &on) {
                unsigned char flag = 1, dest[16] = {};
                const std::function<int64_t()> calls[] = {
                    [&] { return on.ReadBit(flag); },
                    [&] { return on.GetBits(count, flag); },
                    [&] { return on.ReadByte(count, flag); },
                    [&] { return on.ReadShort(count, flag); },
                    [&] { return on.ReadInt(count * 3, flag); },
                    [&] { return on.GetByteArray(dest, count); },
                    [&] { return on.Skip(count), 0; },
                    [&] { return on.RewindBytes(count / 2); },
                    [&] { return on.RwindToFirst(); },
                };
                std::vector<int64_t> results = {calls[operation](), flag};
                results.insert(results.end(), dest, dest + sizeof dest);
                return results;
            };
            ASSERT_EQ(apply(stream), apply(model))
                << "round " << round << " step " << step << ": " << operation << ", " << count;
            ASSERT_EQ(TakeBodies(), model.log);
            model.log.clear();
        }
    }
}

TEST_F(BitInputStream, WithoutASourceEverythingIsRefused) {
    unsigned char byte = 0xFF;
    VarnekCBitInputStream null(nullptr, 1, 1), empty(&byte, 0, 1), copy(null);
    EXPECT_THAT(TakeErrors(), ElementsAre("Source Array is NULL!\n", "Source Array is NULL!\n"));
    for (VarnekCBitInputStream *stream : {&null, &empty, &copy}) {
        stream->RewindBytes(1);
        stream->RewindBytes(0);
        stream->RwindToFirst();
        stream->Skip(5);
        unsigned char flags[2] = {1, 1};
        EXPECT_EQ(stream->ReadInt(32, flags[0]), 0u);
        EXPECT_EQ(stream->GetByteArray(&byte, 1), -22);
        EXPECT_THAT(TakeBodies(), IsEmpty());
        EXPECT_EQ(stream->GetBits(1, flags[1]), 0u);
        EXPECT_THAT(TakeBodies(), ElementsAre("BIS: GetBits Warning: End of Stream!\n"));
        EXPECT_THAT(flags, ElementsAre(0, 0));
    }
    EXPECT_EQ(VarnekCBitInputStream(&byte, 1, 1).GetByteArray(nullptr, 1), -10);
}

TEST_F(BitInputStream, CopiesOwnWhatTheirSourceOwns) {
    unsigned char bytes[] = {0x12, 0x34, 0x56};
    unsigned char flag = 1;
    auto owner = std::make_unique<VarnekCBitInputStream>(bytes, 3u, 1);
    VarnekCBitInputStream borrower(bytes, 3, 0), target(bytes, 3, 1), shared(bytes, 1, 1);
    owner->ReadByte(4, flag);
    VarnekCBitInputStream copy(*owner);
    target = *owner;
    const VarnekCBitInputStream &same = target;
    target = same;
    shared = borrower;
    owner->ReadInt(20, flag);
    owner.reset();
    bytes[1] = 0xFF;
    EXPECT_EQ(copy.ReadInt(20, flag), 0x23456u);
    EXPECT_EQ(target.ReadInt(20, flag), 0x23456u);
    EXPECT_EQ(borrower.ReadInt(24, flag), 0x12FF56u);
    EXPECT_EQ(shared.ReadInt(24, flag), 0x12FF56u);
    EXPECT_EQ(flag, 1);
}

}  // namespace
