#include "comgui/ticket/PARAM_TYPE.h"

template <>
PARAM_TYPE GetParamType<void*>()
{
    return PARAM_POINTER;
}

template <>
PARAM_TYPE GetParamType<int>()
{
    return PARAM_INT;
}

template <>
PARAM_TYPE GetParamType<double>()
{
    return PARAM_DOUBLE;
}

template <>
PARAM_TYPE GetParamType<char const*>()
{
    return PARAM_STRING;
}

template <>
PARAM_TYPE GetParamType<long long>()
{
    return PARAM_INT64;
}

template <>
PARAM_TYPE GetParamType<unsigned int>()
{
    return PARAM_UNSIGNED;
}

template <>
PARAM_TYPE GetParamType<unsigned long long>()
{
    return PARAM_UNSIGNED64;
}
