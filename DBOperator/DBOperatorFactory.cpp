#include "DBOperator/DBOperatorFactory.h"

#include "DBOperator/SQLiteOperator.h"

#include <new>

CDBOperator* CDBOperatorFactory::CreateDBOperator(DB_OPERATOR_TYPE eType)
{
    if (eType == DB_OPERATOR_SQLITE)
    {
        return new (std::nothrow) CSQLiteOperator;
    }
    return nullptr;
}
