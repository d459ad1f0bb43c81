// The link steps of the linked list, for nodes that the caller allocates and frees. Private.
#ifndef VARNEK_SOURCE_LISTLINK_H
#define VARNEK_SOURCE_LISTLINK_H

#include "Varnek_List.h"

// Links a node for `data` before `next`, or at the tail if `next` is null.
inline void LinkBefore(list_t *list, list_node_t *next, list_node_t *node, void *data) {
    list_node_t *const prev = next != nullptr ? next->prev : list->tail;
    *node = {data, prev, next};
    list_node_t **const forward = prev != nullptr ? &prev->next : &list->head;
    list_node_t **const backward = next != nullptr ? &next->prev : &list->tail;
    *forward = *backward = node;
    list->count++;
}

inline void Unlink(list_t *list, const list_node_t *node) {
    list_node_t **const forward = node->prev != nullptr ? &node->prev->next : &list->head;
    list_node_t **const backward = node->next != nullptr ? &node->next->prev : &list->tail;
    *forward = node->next;
    *backward = node->prev;
    list->count--;
}

#endif
