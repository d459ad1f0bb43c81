// The linked list: a sequence of operations against a deque, with every link looked at after each.
#include <deque>

#include "Fuzz.h"
#include "Varnek_List.h"

namespace {

void CheckLinks(list_t *list, const std::deque<void *> &model) {
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
    std::deque<void *> model;
    while (!input.Empty()) {
        const int kind = input.Below(12);
        const int position = kind >= 4 ? input.Int() : 0;
        const bool inside = position >= 0 && position < list.count;
        void *const fresh = kind < 6 ? malloc(1) : nullptr;
        void *expected = nullptr;
        void *removed = nullptr;
        switch (kind) {
            case 0:
                list_insertHead(&list, fresh);
                model.push_front(fresh);
                break;
            case 1:
                list_insertTail(&list, fresh);
                model.push_back(fresh);
                break;
            case 2:
            case 3:
                list_insert(&list, fresh);
                model.push_back(fresh);
                break;
            case 4:
            case 5:
                list_insertAt(&list, position, fresh);
                if (position < 0) {
                    free(fresh);
                } else {
                    model.insert(inside ? model.begin() + position : model.end(), fresh);
                }
                break;
            case 6:
            case 7:
                removed = kind == 6 ? list_removeHead(&list) : list_removeTail(&list);
                if (!model.empty()) {
                    expected = kind == 6 ? model.front() : model.back();
                    kind == 6 ? model.pop_front() : model.pop_back();
                }
                break;
            case 8:
            case 9:
                CHECK(list_element(&list, position) == (inside ? model[static_cast<size_t>(position)] : nullptr));
                removed = list_remove(&list, position);
                if (inside) {
                    expected = model[static_cast<size_t>(position)];
                    model.erase(model.begin() + position);
                }
                break;
            case 10:
                if (inside) {
                    list_node_t *node = list_head(&list);
                    for (int i = 0; i < position; ++i) {
                        node = list_next(node);
                    }
                    list_remove_node(&list, node);
                    model.erase(model.begin() + position);
                }
                break;
            default:
                if (position == 1) {
                    list_removeAll(&list);
                    model.clear();
                }
                list_insertTail(&list, nullptr);
                break;
        }
        CHECK(removed == expected);
        free(removed);
        CheckLinks(&list, model);
    }
    list_removeAll(&list);
    return 0;
}
