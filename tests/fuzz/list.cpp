// The linked list: a sequence of operations compared with a vector. Every link is checked after each operation.
#include <algorithm>

#include "Fuzz.h"
#include "Varnek_List.h"

namespace {

void CheckLinks(list_t *list, const std::vector<void *> &model) {
    CHECK(list->count == static_cast<int32_t>(model.size()));
    list_node_t *previous = nullptr;
    list_node_t *node = list_head(list);
    for (void *data : model) {
        CHECK(node != nullptr && node->prev == previous && list_data(node) == data);
        previous = node;
        node = list_next(node);
    }
    CHECK(node == nullptr && list_tail(list) == previous);
}

}  // namespace

int LLVMFuzzerTestOneInput(const uint8_t *data, size_t size) {
    Input input(data, size);
    list_t list;
    list_initialize(&list);
    std::vector<void *> model;
    while (!input.Empty()) {
        const int kind = input.Below(12);
        const int count = static_cast<int>(model.size());
        int position = kind >= 4 ? input.Int() : 0;
        if (kind < 6) {
            void *const fresh = malloc(1);
            if (kind < 4) {
                (kind == 0 ? list_insertHead : kind == 1 ? list_insertTail : list_insert)(&list, fresh);
            } else {
                list_insertAt(&list, position, fresh);
            }
            position = kind == 0 || kind > 3 ? std::min(position, count) : count;
            if (position < 0) {
                free(fresh);
            } else {
                model.insert(model.begin() + position, fresh);
            }
        } else if (kind == 11) {
            if (position == 1) {
                list_removeAll(&list);
                model.clear();
            }
            list_insertTail(&list, nullptr);
        } else {
            position = kind == 6 ? 0 : kind == 7 ? count - 1 : position;
            const bool inside = position >= 0 && position < count;
            void *const expected = inside ? model[static_cast<size_t>(position)] : nullptr;
            CHECK(list_element(&list, position) == expected);
            if (kind == 10 && inside) {
                list_node_t *node = list_head(&list);
                for (int i = 0; i < position; ++i) {
                    node = list_next(node);
                }
                list_remove_node(&list, node);
            } else if (kind != 10) {
                void *const removed = kind == 6   ? list_removeHead(&list)
                                      : kind == 7 ? list_removeTail(&list)
                                                  : list_remove(&list, position);
                CHECK(removed == expected);
                free(removed);
            }
            if (inside) {
                model.erase(model.begin() + position);
            }
        }
        CheckLinks(&list, model);
    }
    list_removeAll(&list);
    return 0;
}
