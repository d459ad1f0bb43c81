// The bit stream against a model that moves single bits and works piece by piece.
#include "Varnek_CBitInputStream.h"

#include <algorithm>
#include <functional>
#include <memory>
#include <new>
#include <random>

#include "support/BitStreamModel.h"
#include "support/VarnekTest.h"

namespace {

using ::testing::ElementsAre;
using ::testing::IsEmpty;

class BitInputStream : public VarnekTest {};

TEST_F(BitInputStream, BehavesLikeTheModel) {
    std::mt19937 random(20070212);
    const auto pick = [&random](int low, int high) { return std::uniform_int_distribution<int>(low, high)(random); };
    for (int round = 0; round < 600; ++round) {
        std::vector<unsigned char> bytes(static_cast<size_t>(pick(1, 14)));
        std::generate(bytes.begin(), bytes.end(), random);
        VarnekCBitInputStream stream(bytes.data(), static_cast<unsigned int>(bytes.size()),
                                     static_cast<unsigned char>(pick(0, 2)));
        BitStreamModel model{bytes};
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
