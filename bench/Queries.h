#ifndef QV_BENCH_QUERIES_H
#define QV_BENCH_QUERIES_H

#include "Core/Records/SearchRecords.h"

// One text that a person types key by key.
struct tag_Query
{
    IME_SEARCH_TYPE eType;
    const wchar_t* szText;
};

// Initials, whole and partial readings, mixed forms, polyphones, Latin, digits, texts of ten
// characters, and the worst that are known.
constexpr tag_Query QUERIES[] = {
    {IME_SEARCH_WORD, L"zw"},         {IME_SEARCH_WORD, L"wxm"},
    {IME_SEARCH_WORD, L"lj"},         {IME_SEARCH_WORD, L"zhangwei"},
    {IME_SEARCH_WORD, L"wangfang"},   {IME_SEARCH_WORD, L"lina"},
    {IME_SEARCH_WORD, L"liuyang"},    {IME_SEARCH_WORD, L"chenjing"},
    {IME_SEARCH_WORD, L"zhangw"},     {IME_SEARCH_WORD, L"zhwei"},
    {IME_SEARCH_WORD, L"wanfa"},      {IME_SEARCH_WORD, L"lixiaoh"},
    {IME_SEARCH_WORD, L"zhanxiuyin"}, {IME_SEARCH_WORD, L"yangxuemei"},
    {IME_SEARCH_WORD, L"shantian"},   {IME_SEARCH_WORD, L"zengchang"},
    {IME_SEARCH_WORD, L"lexing"},     {IME_SEARCH_WORD, L"chongqing"},
    {IME_SEARCH_WORD, L"xian"},       {IME_SEARCH_WORD, L"changsha"},
    {IME_SEARCH_WORD, L"wtom"},       {IME_SEARCH_WORD, L"zhangtom"},
    {IME_SEARCH_WORD, L"tom#lee"},    {IME_SEARCH_WORD, L"anna"},
    {IME_SEARCH_WORD, L"kevin#wang"}, {IME_SEARCH_WORD, L"张wei"},
    {IME_SEARCH_WORD, L"王小"},       {IME_SEARCH_WORD, L"bjkjgs"},
    {IME_SEARCH_WORD, L"####"},       {IME_SEARCH_WORD, L"aaaaaaaaaa"},
    {IME_SEARCH_WORD, L"anananan"},   {IME_SEARCH_WORD, L"enenenenen"},
    {IME_SEARCH_WORD, L"zzzzzzzzzz"}, {IME_SEARCH_WORD, L"wangwangwa"},
    {IME_SEARCH_NUM, L"99"},          {IME_SEARCH_NUM, L"9264"},
    {IME_SEARCH_NUM, L"94264934"},    {IME_SEARCH_NUM, L"926432"},
    {IME_SEARCH_NUM, L"5483264"},     {IME_SEARCH_NUM, L"866533"},
    {IME_SEARCH_NUM, L"2436546464"},  {IME_SEARCH_NUM, L"2222222222"},
    {IME_SEARCH_NUM, L"9494949494"},  {IME_SEARCH_NUM, L"9692649698"},
    {IME_SEARCH_NUM, L"6264626462"},  {IME_SEARCH_NUM, L"2426426426"},
    {IME_SEARCH_SPECIAL, L"hj"},      {IME_SEARCH_SPECIAL, L"tianqi"},
};

#endif
