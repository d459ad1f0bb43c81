// What the families of named objects share: registries that can be full and, except for timers, handles that never come
// back.
#include "../CommonUtility/source/Varnek_SlotTable.h"
#include "support/Families.h"
#include "support/VarnekTest.h"

namespace {

class NamedObjects : public VarnekTest {};

TEST_F(NamedObjects, AFullRegistryOfEachFamilyHasRoomAfterARemoval) {
    notesLow_ = false;
    for (const Family &family : kFamilies) {
        std::vector<int32_t> handles = family.Fill();
        Noting(std::string(family.name) + ": create", family.create)("one more");
        EXPECT_TRUE(family.remove(handles[7]));
        handles[7] = family.create("one more");
        const int32_t again = family.create("one more");
        Note(std::to_string(handles.size()) + " " + family.name + ", the last " + std::to_string(handles[7]) +
             ", with the same name " + std::to_string(again) + "\n");
        handles.push_back(again);
        std::for_each(handles.begin(), handles.end(), family.remove);
    }
}

// A table that has given out all handles but two.
struct LateTable : SlotTable<int, 3> {
    LateTable() { SkipHandles(INT32_MAX - 2); }
};

TEST_F(NamedObjects, HandlesEnd) {
    static LateTable table;
    EXPECT_EQ(table.Publish(table.FirstFree(), "a"), INT32_MAX - 1);
    EXPECT_EQ(table.Publish(table.FirstFree(), "b"), INT32_MAX);
    EXPECT_EQ(table.NumberOf(table.Find(INT32_MAX)), 1);
    EXPECT_EQ(table.FirstFree(), nullptr);
    EXPECT_EQ(table.Withdraw(table.Find(INT32_MAX - 1)), 1);
    EXPECT_EQ(table.FirstFree(), nullptr) << "there was no handle left for the free slot";
}

}  // namespace
