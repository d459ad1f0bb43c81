// The bit stream: a sequence of operations on borrowed and copied bytes, compared with a model that moves single bits.
#include <algorithm>
#include <memory>

#include "Fuzz.h"
#include "Varnek_CBitInputStream.h"

namespace {

struct BitStreamModel {
    explicit BitStreamModel(const std::vector<unsigned char> &source) : bytes(source) {}

    std::vector<unsigned char> bytes;
    const int size = static_cast<int>(bytes.size());
    int index = 0;     // of the current byte; `size` at the end of the stream
    int consumed = 0;  // bits of the current byte, as counted; after a rewind from inside a byte, `taken` is less
    int taken = 0;

    uint32_t Take(int count, unsigned char &flag) {
        uint32_t value = 0;
        for (; count > 0; --count) {
            value <<= 1;
            if (index == size) {
                flag = 0;
                continue;
            }
            value |= uint32_t{bytes[static_cast<size_t>(index)]} >> (7 - taken++) & 1;
            if (++consumed == 8) {
                ++index;
                consumed = taken = 0;
            }
        }
        return value;
    }
    uint32_t Read(int count, int largest, unsigned char &flag) {
        return count < 0 || count > largest || index == size ? flag = 0 : Take(count, flag);
    }
    int GetByteArray(std::vector<unsigned char> &dest, int count) {
        if (index == size || consumed != 0 || count < 0 || count > size - index) {
            return index == size ? VARNEK_BITS_END : consumed != 0 ? VARNEK_BITS_NOT_ALIGNED : VARNEK_BITS_TOO_FEW;
        }
        std::copy_n(bytes.begin() + index, count, dest.begin());
        index += count;
        return 0;
    }
    void Rewind(int count) {
        if (count <= index && index - count < size) {
            index -= count;
            taken = 0;
        }
    }
};

}  // namespace

int LLVMFuzzerTestOneInput(const uint8_t *data, size_t size) {
    Input input(data, size);
    const uint8_t mode = input.Byte();
    std::vector<unsigned char> source = input.Bytes(mode / 4u + 1);
    if (source.empty()) {
        return 0;
    }
    BitStreamModel model(source);
    const auto length = static_cast<unsigned int>(source.size());
    auto stream = std::make_unique<VarnekCBitInputStream>(source.data(), length, mode % 2);
    while (!input.Empty()) {
        const int kind = input.Below(10);
        // The model takes one step per bit, so counts stay small.
        const int count = input.Int() % 4096;
        unsigned char flag = 1, expectedFlag = 1;
        if (kind < 5) {
            const int largest[] = {1, 8 - model.consumed, 8, 16, 32};
            const uint32_t expected = model.Read(kind == 0 ? 1 : count, largest[kind], expectedFlag);
            const uint32_t value = kind == 0   ? stream->ReadBit(flag)
                                   : kind == 1 ? stream->GetBits(count, flag)
                                   : kind == 2 ? stream->ReadByte(count, flag)
                                   : kind == 3 ? stream->ReadShort(count, flag)
                                               : stream->ReadInt(count, flag);
            CHECK(value == expected && flag == expectedFlag);
        } else if (kind == 5) {
            std::vector<unsigned char> bytes(static_cast<size_t>(std::max(count, 0))), expected = bytes;
            CHECK(stream->GetByteArray(bytes.data(), count) == model.GetByteArray(expected, count));
            CHECK(bytes == expected);
        } else if (kind == 6) {
            CHECK(stream->RewindBytes(count) == 0);
            model.Rewind(count);
        } else if (kind == 7) {
            CHECK(stream->RwindToFirst() == 0);
            model.index = model.consumed = model.taken = 0;
        } else if (kind == 8) {
            stream->Skip(count);
            model.Take(count, expectedFlag);
        } else if (model.index != model.size - 1) {  // once loaded, the last byte cannot change
            // A copy owns its bytes if its source does.
            auto copy = std::make_unique<VarnekCBitInputStream>(*stream);
            if (count % 2 != 0) {
                copy = std::make_unique<VarnekCBitInputStream>(source.data(), 1, 1);
                *copy = *stream;
                const VarnekCBitInputStream &same = *copy;
                *copy = same;
            }
            stream = std::move(copy);
            source.back() ^= 1;
            if (mode % 2 == 0) {
                model.bytes.back() ^= 1;
            }
        }
    }
    return 0;
}
