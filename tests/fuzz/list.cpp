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
        const int count = list.count;
        const int position = input.Int();
        const int place = kind == 0 || kind == 6 ? 0 : kind < 4 ? count : kind == 7 ? count - 1 : position;
        const bool inside = place >= 0 && place < count;
        void *const present = inside ? model[static_cast<size_t>(place)] : nullptr;
        CHECK(list_element(&list, place) == present);
        if (kind < 6) {
            void *const fresh = malloc(1);
            kind == 0   ? list_insertHead(&list, fresh)
            : kind == 1 ? list_insertTail(&list, fresh)
            : kind < 4  ? list_insert(&list, fresh)
                        : list_insertAt(&list, position, fresh);
            if (place < 0) {
                free(fresh);
            } else {
                model.insert(model.begin() + std::min(place, count), fresh);
            }
        } else if (kind < 10) {
            void *const removed = kind == 6   ? list_removeHead(&list)
                                  : kind == 7 ? list_removeTail(&list)
                                              : list_remove(&list, position);
            CHECK(removed == present);
            free(removed);
        } else if (kind == 10) {
            list_node_t *node = list_head(&list);
            while (node != nullptr && list_data(node) != present) {
                node = list_next(node);
            }
            list_remove_node(&list, node);
        } else if (position == 1) {
            list_removeAll(&list);
            model.clear();
        } else {
            list_insertTail(&list, nullptr);
        }
        if (inside && kind >= 6 && kind <= 10) {
            model.erase(model.begin() + place);
        }
        CheckLinks(&list, model);
    }
    list_removeAll(&list);
    return 0;
}
