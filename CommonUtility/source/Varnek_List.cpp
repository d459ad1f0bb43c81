// The linked list.
#include "Varnek_List.h"

#include <stdlib.h>

#include "Varnek_ListLink.h"

namespace {

// Links a new node for `data` before `next`, or at the tail if `next` is null.
void InsertBefore(list_t *list, list_node_t *next, void *data) {
    list_node_t *node = static_cast<list_node_t *>(malloc(sizeof(list_node_t)));
    if (node != nullptr) {
        LinkBefore(list, next, node, data);
    }
}

// Unlinks a node of the list, frees it and returns its data.
void *Remove(list_t *list, list_node_t *node) {
    Unlink(list, node);
    void *data = node->data;
    free(node);
    return data;
}

// Returns the node at a position, null outside the list.
list_node_t *NodeAt(const list_t *list, int32_t position) {
    if (position < 0 || position >= list->count) {
        return nullptr;
    }
    list_node_t *node = list->head;
    while (position-- > 0) {
        node = node->next;
    }
    return node;
}

}  // namespace

void list_initialize(list_t *list) {
    if (list != nullptr) {
        *list = {};
    }
}

void list_insertHead(list_t *list, void *data) {
    if (list != nullptr && data != nullptr) {
        InsertBefore(list, list->head, data);
    }
}

void list_insertTail(list_t *list, void *data) {
    if (list != nullptr && data != nullptr) {
        InsertBefore(list, nullptr, data);
    }
}

void list_insert(list_t *list, void *data) {
    list_insertTail(list, data);
}

void list_insertAt(list_t *list, int32_t position, void *data) {
    if (list != nullptr && data != nullptr && position >= 0) {
        InsertBefore(list, NodeAt(list, position), data);
    }
}

void *list_element(list_t *list, int32_t position) {
    return list_data(list != nullptr ? NodeAt(list, position) : nullptr);
}

void *list_removeHead(list_t *list) {
    return list != nullptr && list->head != nullptr ? Remove(list, list->head) : nullptr;
}

void *list_removeTail(list_t *list) {
    return list != nullptr && list->tail != nullptr ? Remove(list, list->tail) : nullptr;
}

void *list_remove(list_t *list, int32_t position) {
    if (list == nullptr) {
        return nullptr;
    }
    // The tail is known; any other position needs a walk from the head.
    list_node_t *node = position == list->count - 1 ? list->tail : NodeAt(list, position);
    return node != nullptr ? Remove(list, node) : nullptr;
}

void list_removeAll(list_t *list) {
    if (list == nullptr) {
        return;
    }
    list_node_t *node = list->head;
    list_initialize(list);
    while (node != nullptr) {
        list_node_t *next = node->next;
        free(node->data);
        free(node);
        node = next;
    }
}

void list_remove_node(list_t *list, list_node_t *node) {
    if (list != nullptr && node != nullptr) {
        free(Remove(list, node));
    }
}

list_node_t *list_head(list_t *list) {
    return list != nullptr ? list->head : nullptr;
}

list_node_t *list_tail(list_t *list) {
    return list != nullptr ? list->tail : nullptr;
}

list_node_t *list_next(list_node_t *node) {
    return node != nullptr ? node->next : nullptr;
}

void *list_data(list_node_t *node) {
    return node != nullptr ? node->data : nullptr;
}
