// What a bit stream logs, and how one without a source behaves. fuzz/bit_stream.cpp compares it with a model.
#include "Varnek_CBitInputStream.h"

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

}  // namespace
