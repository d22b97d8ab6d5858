// The catalogue of web-page templates, "Templates/TEMP.INI" in the program folder.
#pragma once

#include "navmisc/platform/lists.h"
#include "navmisc/records/items.h"

// TEMPLATE_ITEM_INFO*, in catalogue order, owned by the list.
extern CPtrList g_plTemplateItemList;

// Appends the catalogue's templates, localised into `language` (a web language code, falling
// back to the default texts); returns the number of records in the list afterwards.
int ReadTemplateInfo(CString language);
// Removes and deletes every record of the list.
void FreeTemplateInfo();
