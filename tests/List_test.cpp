// A list that is null. fuzz/list.cpp compares the operations with a model.
#include "Varnek_List.h"

#include "support/VarnekTest.h"

namespace {

TEST(List, NullIsAccepted) {
    int data = 0;
    list_initialize(nullptr);
    list_insertHead(nullptr, &data);
    list_insertTail(nullptr, &data);
    list_insert(nullptr, &data);
    list_insertAt(nullptr, 0, &data);
    list_removeAll(nullptr);
    list_remove_node(nullptr, nullptr);
    EXPECT_EQ(list_element(nullptr, 0), nullptr);
    EXPECT_EQ(list_removeHead(nullptr), nullptr);
    EXPECT_EQ(list_removeTail(nullptr), nullptr);
    EXPECT_EQ(list_remove(nullptr, 0), nullptr);
    EXPECT_EQ(list_head(nullptr), nullptr);
    EXPECT_EQ(list_tail(nullptr), nullptr);
    EXPECT_EQ(list_next(nullptr), nullptr);
    EXPECT_EQ(list_data(nullptr), nullptr);
}

}  // namespace
