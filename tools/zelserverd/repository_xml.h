// The elements of the "REP_" reply documents. Each appends one element, with its children, to
// `parent`; properties and headers are read from the repository store.
#pragma once

#include <pugixml.hpp>

#include <string>

#include "item_header.h"
#include "repository_store.h"

namespace zelserverd {

// The kind as reply documents and "itemType" write it: WORKSPACE, CUSTOMFORMAT, ... OTHER.
std::string kindWord(ItemKind kind);
// The header of a stored item; what does not parse is left out.
ItemHeader headerOf(RepositoryStore& repos, const ItemRecord& item);

void appendRepository(pugi::xml_node parent, const RepositoryRecord& repo);
void appendService(RepositoryStore& repos, pugi::xml_node parent, const ServiceRecord& s);
void appendItem(pugi::xml_node parent, const ItemRecord& item, const ItemHeader& h);
void appendSummary(pugi::xml_node parent, const ItemRecord& item, const ItemHeader& h);
void appendResource(pugi::xml_node parent, const ResourceRecord& r);
void appendWorkspace(RepositoryStore& repos, pugi::xml_node parent, const ItemRecord& item);
// The custom format, custom transformer and template views share one shape.
void appendCustom(RepositoryStore& repos, pugi::xml_node parent, const char* element, const ItemRecord& item);
void appendFormat(RepositoryStore& repos, pugi::xml_node parent, const ItemRecord& item);
void appendTransformer(RepositoryStore& repos, pugi::xml_node parent, const ItemRecord& item);
void appendTemplate(RepositoryStore& repos, pugi::xml_node parent, const ItemRecord& item);
// One "PROPERTY" per item: the repository is the category, the item the name, its kind the
// value; the details are the property's attributes.
void appendGlobalItem(RepositoryStore& repos, pugi::xml_node parent, const ItemRecord& item);

}  // namespace zelserverd
