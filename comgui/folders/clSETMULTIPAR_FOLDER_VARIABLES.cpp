#include "comgui/folders/clSETMULTIPAR_FOLDER_VARIABLES.h"

#include "comgui/ticket/STRINGCACHE.h"
#include "comgui/ticket/clFOLDER_VARIABLES.h"
#include <cstdlib>
#include <cstring>
#include <string>

namespace
{
// The record's text; null if it has none, or nothing to translate in it.
char const* TextOf(SETMULTIPAR const& record)
{
    if (record.type != PARAM_STRING)
        return nullptr;
    char const* const text = static_cast<char const*>(record.value);
    return text && *text ? text : nullptr;
}
}  // namespace

clSETMULTIPAR_FOLDER_VARIABLES::clSETMULTIPAR_FOLDER_VARIABLES(clFOLDER_VARIABLES* folders,
                                                               SETMULTIPAR* table, bool encode)
    : source(table), copy(nullptr), current(table), cache(nullptr)
{
    if (folders == nullptr || !TableNeedsEncodeDecode(table))
        return;
    // Nobody looks at whether there is memory, by design; and what throws below leaves copy and cache behind.
    copy = static_cast<SETMULTIPAR*>(std::malloc(TableSize(table)));
    cache = new STRINGCACHE;
    std::memcpy(copy, table, TableSize(table));
    for (SETMULTIPAR* record = copy; record->key; ++record)
    {
        char const* const text = TextOf(*record);
        if (text == nullptr)
            continue;
        std::string const translated = encode ? folders->Encode(text) : folders->Decode(text, false);
        if (std::strcmp(translated.c_str(), text) == 0)
            continue;
        record->value = (*cache)[translated.c_str()];
        current = copy;
    }
}

clSETMULTIPAR_FOLDER_VARIABLES::~clSETMULTIPAR_FOLDER_VARIABLES()
{
    delete cache;
    std::free(copy);
}

void clSETMULTIPAR_FOLDER_VARIABLES::ResultCpy()
{
    if (source == current || source == nullptr || current == nullptr)
        return;
    for (unsigned long i = 0; source[i].key; ++i)
        source[i].ok = comgui::detail::IsOk(current[i]);
}

bool clSETMULTIPAR_FOLDER_VARIABLES::TableNeedsEncodeDecode(SETMULTIPAR const* table)
{
    for (; table->key; ++table)
        if (TextOf(*table))
            return true;
    return false;
}

unsigned long clSETMULTIPAR_FOLDER_VARIABLES::TableSize(SETMULTIPAR const* table)
{
    unsigned long size = sizeof *table;
    for (; table->key; ++table)
        size += sizeof *table;
    return size;
}
