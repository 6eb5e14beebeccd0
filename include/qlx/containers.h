/**
 * @file
 * The groups, lists and maps of the library: doubly linked nodes in the order of insertion. A group
 * holds no element twice, a list may and counts its nodes, a map finds values by name.
 *
 * Heads and nodes are read only, and both are made by the functions here alone: the functions keep
 * more behind their fields than a caller sees. A head of another origin, one on a stack or a copied
 * record, is written past; one who writes into a node hides its element from lookups.
 */
#ifndef QLX_CONTAINERS_H
#define QLX_CONTAINERS_H

#include <qlx/containers/ListenerGroup.h>
#include <qlx/containers/ParmList.h>
#include <qlx/containers/StringGroup.h>
#include <qlx/containers/StringList.h>
#include <qlx/containers/StringToObjCfgMap.h>
#include <qlx/containers/StringToObjClassMap.h>
#include <qlx/containers/StringToObjMap.h>
#include <qlx/containers/StringToStringMap.h>

#endif
