// The bit stream: a sequence of operations on borrowed and copied bytes, compared with the model that moves single
// bits.
#include "BitStreamModel.h"
#include "Fuzz.h"

int LLVMFuzzerTestOneInput(const uint8_t *data, size_t size) {
    Input input(data, size);
    const uint8_t mode = input.Byte();
    std::vector<unsigned char> source = input.Bytes(mode / 4u + 1);
    if (source.empty()) {
        return 0;
    }
    BitStreamModel model(source);
    VarnekCBitInputStream stream(source.data(), static_cast<unsigned int>(source.size()), mode % 2);
    while (!input.Empty()) {
        const int kind = input.Below(10);
        // The model takes a step for each bit. It knows no place beyond 32 bits, and no caller needs one.
        const int count = input.Int() % 4096;
        if (kind == 9) {
            stream = VarnekCBitInputStream(stream);
            continue;
        }
        const auto apply = [=](auto &target, unsigned char &flag, std::vector<unsigned char> &bytes) -> int64_t {
            return kind == 0   ? target.ReadBit(flag)
                   : kind == 1 ? target.GetBits(count, flag)
                   : kind == 2 ? target.ReadByte(count, flag)
                   : kind == 3 ? target.ReadShort(count, flag)
                   : kind == 4 ? target.ReadInt(count, flag)
                   : kind == 5 ? target.GetByteArray(bytes.data(), count)
                   : kind == 6 ? target.RewindBytes(count)
                   : kind == 7 ? target.RwindToFirst()
                               : (target.Skip(count), int64_t{0});
        };
        const size_t room = kind == 5 && count > 0 ? static_cast<size_t>(count) : 0;
        std::vector<unsigned char> bytes(room), expectedBytes(room);
        unsigned char flag = 1, expectedFlag = 1;
        const int64_t expected = apply(model, expectedFlag, expectedBytes);
        CHECK(apply(stream, flag, bytes) == expected && flag == expectedFlag && bytes == expectedBytes);
    }
    return 0;
}
