// The bit stream: a sequence of operations on borrowed and copied bytes, against the model that
// moves single bits.
#include "BitStreamModel.h"
#include "Fuzz.h"
#include "Varnek_CBitInputStream.h"

namespace {

struct Operation {
    int kind;
    int count;
};

template <typename Stream>
int64_t Apply(Stream &stream, const Operation &operation, unsigned char &flag, std::vector<unsigned char> &bytes) {
    const int count = operation.count;
    switch (operation.kind) {
        case 0:
            return stream.ReadBit(flag);
        case 1:
            return stream.GetBits(count, flag);
        case 2:
            return stream.ReadByte(count, flag);
        case 3:
            return stream.ReadShort(count, flag);
        case 4:
            return stream.ReadInt(count, flag);
        case 5:
            return stream.GetByteArray(bytes.data(), count);
        case 6:
            return stream.RewindBytes(count);
        case 7:
            return stream.RwindToFirst();
        default:
            stream.Skip(count);
            return 0;
    }
}

}  // namespace

int LLVMFuzzerTestOneInput(const uint8_t *data, size_t size) {
    Input input(data, size);
    const uint8_t mode = input.Byte();
    std::vector<unsigned char> source = input.Bytes(mode / 4u + 1);
    if (source.empty()) {
        return 0;
    }
    CollectTraces();
    BitStreamModel model(source);
    VarnekCBitInputStream stream(source.data(), static_cast<unsigned int>(source.size()), mode % 2);
    while (!input.Empty()) {
        Operation operation{input.Below(10), input.Int()};
        if (operation.kind == 9) {
            stream = VarnekCBitInputStream(stream);
            continue;
        }
        // The model takes a step for each bit; and it knows no place beyond 32 bits, nor has a
        // caller a need to.
        operation.count %= 4096;
        const size_t room = operation.kind == 5 && operation.count > 0 ? static_cast<size_t>(operation.count) : 0;
        std::vector<unsigned char> bytes(room), expectedBytes(room);
        unsigned char flag = 1, expectedFlag = 1;
        const int64_t expected = Apply(model, operation, expectedFlag, expectedBytes);
        CHECK(Apply(stream, operation, flag, bytes) == expected);
        CHECK(flag == expectedFlag && bytes == expectedBytes);
        CheckTraces(model.log);
        model.log.clear();
    }
    return 0;
}
