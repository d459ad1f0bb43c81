/// @file
/// A doubly linked list of untyped data pointers. The list owns its nodes but not the data, unless
/// a call says otherwise. Not thread-safe: callers that share a list must guard it.
///
/// With a null list every call does nothing, and returns null if it returns anything. Positions
/// count from 0 at the head. Null is never stored, so removing returns null only if nothing was
/// removed. If there is no memory for a node, inserting leaves the list unchanged. Nothing is
/// traced.
/// @see [Guide: lists](docs/guide/lists.md)
#ifndef VARNEK_LIST_H
#define VARNEK_LIST_H

#include "Varnek_Common.h"

#ifdef __cplusplus
extern "C" {
#endif

/// A node, allocated with malloc; it belongs to the list until it is removed.
typedef struct list_node_t {
    void *data;                ///< owned by the caller, never null
    struct list_node_t *prev;  ///< null at the head
    struct list_node_t *next;  ///< null at the tail
} list_node_t;

/// A list. A list whose bytes are all zero is empty.
typedef struct list_t {
    int32_t count;      ///< number of nodes
    list_node_t *head;  ///< null when empty
    list_node_t *tail;  ///< null when empty
} list_t;

/// Makes the list empty without freeing its nodes.
VARNEK_API void list_initialize(list_t *list);

/// Inserts data at the head.
VARNEK_API void list_insertHead(list_t *list, void *data);
/// Inserts data at the tail.
VARNEK_API void list_insertTail(list_t *list, void *data);
VARNEK_API void list_insert(list_t *list, void *data);  ///< as list_insertTail
/// Inserts data at a position: at the tail if that is past the end, nowhere if it is negative.
VARNEK_API void list_insertAt(list_t *list, int32_t position, void *data);

/// Returns the data at a position; null outside the list.
VARNEK_API void *list_element(list_t *list, int32_t position);

/// Removes the first node and returns its data, which the caller owns.
VARNEK_API void *list_removeHead(list_t *list);
VARNEK_API void *list_removeTail(list_t *list);                ///< likewise, the last node
VARNEK_API void *list_remove(list_t *list, int32_t position);  ///< likewise, at a position

/// Removes all nodes and frees their data, which must come from malloc.
VARNEK_API void list_removeAll(list_t *list);
VARNEK_API void list_remove_node(list_t *list, list_node_t *node);  ///< likewise, one of its nodes

/// Starts a walk: read each node with list_data, and go on with list_next until it returns null.
VARNEK_API list_node_t *list_head(list_t *list);
VARNEK_API list_node_t *list_tail(list_t *list);       ///< the last node
VARNEK_API list_node_t *list_next(list_node_t *node);  ///< the next node
VARNEK_API void *list_data(list_node_t *node);         ///< a node's data

#ifdef __cplusplus
}
#endif

#endif
