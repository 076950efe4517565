#ifndef QV_DBOPERATOR_DBOPERATORFACTORY_H
#define QV_DBOPERATOR_DBOPERATORFACTORY_H

#include "DBOperator/DBOperator.h"

// Kinds of operators; callers may pass any other value.
enum DB_OPERATOR_TYPE : int
{
    DB_OPERATOR_SQLITE = 0
};

// Makes database operators.
class QV_EXPORT CDBOperatorFactory
{
public:
    // A new operator, which the caller deletes; null for an unknown kind or if the allocation
    // fails. Nothing is opened yet.
    static CDBOperator* CreateDBOperator(DB_OPERATOR_TYPE eType);
};

#endif
