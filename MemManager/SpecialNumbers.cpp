#include "MemManager/SpecialNumbers.h"

const tag_LocalizerDetail g_specialNumberRecords[SPECIAL_NUMBER_COUNT] = {
    // 匪警
    {0, 0, {0x1398, 0x3D2B}, {}, 0, 0, 0},
    // 障碍申告
    {1, 1, {0x45E3, 0x2EF6, 0x2C8C, 0x146A}, {}, 0, 0, 0},
    // 本地电话查号
    {2, 2, {0x2219, 0x1684, 0x2C8D, 0x3D89, 0x22A9, 0x1424}, {}, 0, 0, 0},
    // 火警
    {3, 3, {0x291E, 0x3D2B}, {}, 0, 0, 0},
    // 急救中心
    {4, 4, {0x1CD9, 0x20CA, 0x1021, 0x1C90}, {}, 0, 0, 0},
    // 天气预报
    {5, 5, {0x17D6, 0x25A8, 0x4741, 0x1EB9}, {}, 0, 0, 0},
    // 道路交通事故报警
    {6, 6, {0x4115, 0x3F3D, 0x1066, 0x40EE, 0x1054, 0x20C3, 0x1EB9, 0x3D2B}, {}, 0, 0, 0},
};
