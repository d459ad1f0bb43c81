// A doubly linked list of untyped data pointers. It owns its nodes and, where not said otherwise,
// not the data. It has no lock: who shares a list guards it.
//
// A null list is accepted everywhere and nothing happens (results: 0 or null). Positions count from
// 0 at the head. Null data is never stored, so a null result of a removal means that nothing was
// removed. When a node cannot be allocated, an insertion leaves the list unchanged. Nothing is
// traced.
#ifndef VARNEK_LIST_H
#define VARNEK_LIST_H

#include "Varnek_Common.h"

#ifdef __cplusplus
extern "C" {
#endif

// A node, from malloc; the list's until it is removed.
typedef struct list_node_t {
    void *data;                // the caller's, never null
    struct list_node_t *prev;  // null at the head
    struct list_node_t *next;  // null at the tail
} list_node_t;

// A list; all zero is an empty one.
typedef struct list_t {
    int32_t count;      // nodes
    list_node_t *head;  // null when empty
    list_node_t *tail;  // null when empty
} list_t;

// Makes an empty list. Nodes that it had are forgotten, not freed.
VARNEK_API void list_initialize(list_t *list);

// Inserts data at the head.
VARNEK_API void list_insertHead(list_t *list, void *data);
// Insert data at the tail; both do the same.
VARNEK_API void list_insertTail(list_t *list, void *data);
VARNEK_API void list_insert(list_t *list, void *data);
// Inserts data at a position from 0; one at or beyond the count appends, a negative one changes
// nothing.
VARNEK_API void list_insertAt(list_t *list, int32_t position, void *data);

// The data at a position; null outside the list.
VARNEK_API void *list_element(list_t *list, int32_t position);

// Unlink a node and hand its data back to the caller, who owns it then.
VARNEK_API void *list_removeHead(list_t *list);
VARNEK_API void *list_removeTail(list_t *list);
VARNEK_API void *list_remove(list_t *list, int32_t position);

// Unlink nodes and free their data, which came from malloc. The node belongs to the list.
VARNEK_API void list_removeAll(list_t *list);
VARNEK_API void list_remove_node(list_t *list, list_node_t *node);

// Iteration: from list_head with list_next until null, reading each node with list_data.
VARNEK_API list_node_t *list_head(list_t *list);
VARNEK_API list_node_t *list_tail(list_t *list);
VARNEK_API list_node_t *list_next(list_node_t *node);
VARNEK_API void *list_data(list_node_t *node);

#ifdef __cplusplus
}
#endif

#endif
