#include "Varnek_List.h"

#include <deque>
#include <random>

#include "support/VarnekTest.h"

namespace {

// The list holds what the model holds, read in both directions.
void ExpectSame(list_t *list, const std::deque<void *> &model) {
    ASSERT_EQ(list->count, static_cast<int32_t>(model.size()));
    const list_node_t *prev = nullptr;
    size_t position = 0;
    for (list_node_t *node = list_head(list); node != nullptr; node = list_next(node)) {
        ASSERT_LT(position, model.size());
        ASSERT_EQ(list_data(node), model[position++]);
        ASSERT_EQ(node->prev, prev);
        prev = node;
    }
    ASSERT_EQ(position, model.size());
    ASSERT_EQ(list_tail(list), prev);
}

TEST(List, RandomOperationsAgreeWithADeque) {
    std::mt19937 random(7);
    list_t list;
    list_initialize(&list);
    std::deque<void *> model;
    for (int step = 0; step < 20000; step++) {
        const auto count = static_cast<int32_t>(model.size());
        const int32_t position = static_cast<int32_t>(random() % 24) - 2;
        const bool inside = position >= 0 && position < count;
        void *data = count < 20 ? malloc(1) : nullptr;  // null data changes nothing
        void *expected = nullptr;
        void *removed = nullptr;
        switch (random() % 9) {
            case 0:
                list_insertHead(&list, data);
                if (data != nullptr) {
                    model.push_front(data);
                }
                break;
            case 1:
                (step % 2 != 0 ? list_insert : list_insertTail)(&list, data);
                if (data != nullptr) {
                    model.push_back(data);
                }
                break;
            case 2:
                list_insertAt(&list, position, data);
                if (data != nullptr && position >= 0) {
                    model.insert(model.begin() + std::min(position, count), data);
                } else {
                    free(data);
                }
                break;
            case 3:
                free(data);
                expected = inside ? model[static_cast<size_t>(position)] : nullptr;
                EXPECT_EQ(list_element(&list, position), expected);
                break;
            case 4:
            case 5: {
                free(data);
                const bool head = random() % 2 != 0;
                removed = head ? list_removeHead(&list) : list_removeTail(&list);
                if (count > 0) {
                    expected = head ? model.front() : model.back();
                    head ? model.pop_front() : model.pop_back();
                }
                EXPECT_EQ(removed, expected);
                free(removed);
                break;
            }
            case 6:
            case 7:
                free(data);
                removed = list_remove(&list, position);
                if (inside) {
                    expected = model[static_cast<size_t>(position)];
                    model.erase(model.begin() + position);
                }
                EXPECT_EQ(removed, expected);
                free(removed);
                break;
            default:
                free(data);
                if (inside) {
                    list_node_t *node = list_head(&list);
                    for (int32_t i = 0; i < position; i++) {
                        node = list_next(node);
                    }
                    list_remove_node(&list, node);
                    model.erase(model.begin() + position);
                }
        }
        ASSERT_NO_FATAL_FAILURE(ExpectSame(&list, model)) << step;
    }
    list_removeAll(&list);
    ExpectSame(&list, {});
}

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
