// What a bit stream logs and owns, and how one without a source behaves. fuzz/bit_stream.cpp compares it with a model.
#include "Varnek_CBitInputStream.h"

#include <memory>

#include "support/VarnekTest.h"

namespace {

using ::testing::ElementsAre, ::testing::IsEmpty;

class BitInputStream : public VarnekTest {};

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
        EXPECT_EQ(stream->GetByteArray(&byte, 1), VARNEK_BITS_END);
        EXPECT_THAT(TakeBodies(), IsEmpty());
        EXPECT_EQ(stream->GetBits(1, flags[1]), 0u);
        EXPECT_THAT(TakeBodies(), ElementsAre("BIS: GetBits Warning: End of Stream!\n"));
        EXPECT_THAT(flags, ElementsAre(0, 0));
    }
    EXPECT_EQ(VarnekCBitInputStream(&byte, 1, 1).GetByteArray(nullptr, 1), VARNEK_BITS_TOO_FEW);
}

TEST_F(BitInputStream, EveryRefusalHasItsLine) {
    unsigned char byte = 0xA5, flag = 1;
    VarnekCBitInputStream stream(&byte, 1, 1);
    Noting("ReadByte", [&](int count) { return stream.ReadByte(count, flag); })(9);
    Noting("ReadInt", [&](int count) { return stream.ReadInt(count, flag); })(-1);
    for (const int count : {3, 6, -1, 9, 5, 1, 0}) {
        Noting("GetBits", [&](int bits) { return stream.GetBits(bits, flag); })(count);
    }
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
