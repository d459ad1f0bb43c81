// The bit stream: a sequence of operations on borrowed and copied bytes, compared with a model that moves single bits.
#include <algorithm>

#include "Fuzz.h"
#include "Varnek_CBitInputStream.h"

namespace {

struct BitStreamModel {
    explicit BitStreamModel(const std::vector<unsigned char> &source) : bytes(source) {}

    std::vector<unsigned char> bytes;
    int size = static_cast<int>(bytes.size());
    int index = 0;
    int consumed = 0;  // as counted; it differs from `taken` after a rewind from inside a byte
    int taken = 0;
    bool end = false;

    static int64_t Fail(unsigned char &flag) { return flag = 0; }
    int64_t GetBits(int num, unsigned char &flag) {
        if (num > 8 - consumed || end || num < 0) {
            return Fail(flag);
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
            value = (value << piece & UINT32_MAX) | GetBits(piece, flag);
        }
        return value;
    }
    int64_t Read(int count, int largest, unsigned char &flag) {
        return count < 0 || count > largest || end ? Fail(flag) : Pieces(count, flag);
    }
    int64_t ReadBit(unsigned char &flag) { return Read(1, 1, flag); }
    int64_t ReadByte(int count, unsigned char &flag) { return Read(count, 8, flag); }
    int64_t ReadShort(int count, unsigned char &flag) { return Read(count, 16, flag); }
    int64_t ReadInt(int count, unsigned char &flag) { return Read(count, 32, flag); }
    void Skip(int count) {
        unsigned char flag;
        if (count != 0 && !end) {
            Pieces(count, flag);
        }
    }
    int GetByteArray(unsigned char *dest, int count) {
        if (end) {
            return VARNEK_BITS_END;
        }
        if (consumed != 0) {
            return VARNEK_BITS_NOT_ALIGNED;
        }
        if (count < 0 || count > size - index) {
            return VARNEK_BITS_TOO_FEW;
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

}  // namespace

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
        // The model takes one step per bit, so counts stay small.
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
