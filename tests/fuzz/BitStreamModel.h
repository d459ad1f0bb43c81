// A model of the bit stream that moves single bits and works piece by piece.
#ifndef VARNEK_TESTS_FUZZ_BITSTREAMMODEL_H
#define VARNEK_TESTS_FUZZ_BITSTREAMMODEL_H

#include <algorithm>
#include <cstdint>
#include <vector>

#include "Varnek_CBitInputStream.h"

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

#endif
