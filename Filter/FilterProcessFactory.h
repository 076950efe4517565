#ifndef QV_FILTER_FILTERPROCESSFACTORY_H
#define QV_FILTER_FILTERPROCESSFACTORY_H

#include "Common/Export.h"

class FilterProcess;

// Makes the pipeline that narrows records by a chain of filters.
class QV_EXPORT FilterProcessFactory
{
public:
    // The pipeline of all ten processes: account, account expand, group, group expand, phone,
    // mail, favourites, postal, contact id expand, online. Returns its first process, whose
    // deletion deletes them all; null if an allocation fails, since a shorter pipeline would let
    // through what the missing process excludes.
    static FilterProcess* CreateFilterProcess();
};

#endif
