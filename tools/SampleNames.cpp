#include "tools/SampleNames.h"

#include <cstdint>
#include <iterator>

namespace
{

// All kinds of names: simplified, traditional, polyphonic, Latin, mixed, digits, signs,
// other scripts, too long, nothing at all.
constexpr const char* PICKED_NAMES[] = {
    "张三",
    "李四",
    "王五",
    "李张三",
    "張三豐",
    "章三",
    "单田芳",
    "单雄信",
    "曾国藩",
    "曾经",
    "解缙",
    "解放",
    "仇英",
    "查良镛",
    "查理",
    "区寄",
    "朴树",
    "任重",
    "重阳",
    "乐毅",
    "乐嘉",
    "盖聂",
    "华佗",
    "尉迟恭",
    "长孙无忌",
    "万俟卨",
    "翟天临",
    "覃海洋",
    "种师道",
    "盛小宁",
    "行长",
    "银行",
    "歐陽修",
    "司馬光",
    "諸葛亮",
    "劉備",
    "關羽",
    "趙雲",
    "馬超",
    "黃忠",
    "陳奕迅",
    "鄧麗君",
    "張學友",
    "劉德華",
    "郭富城",
    "國家圖書館書記",
    "衝鋒",
    "矽谷",
    "Tom",
    "Tom 2",
    "Anna Smith",
    "O'Brien",
    "José García",
    "Müller",
    "Al",
    "ALICE",
    "bob",
    "Zoë",
    "Zhang San",
    "Li",
    "王Li",
    "李Lee",
    "A张",
    "Peter 王",
    "老王@家",
    "小李 (公司)",
    "张 三",
    "张-三",
    "110",
    "10086",
    "5号楼王师傅",
    "2班班长",
    "114查号",
    "7-11便利店",
    "#1",
    "+86 王",
    "*星*",
    "  ",
    "",
    "",
    "さくら",
    "김철수",
    "Анна",
    "Ελένη",
    "小明😀",
    "😀",
    "龘",
    "中华人民共和国外交部领事司",
    "阿卜杜拉·热合曼",
    "ABCDEFGHIJKLMNOP",
    "abcdefghij",
    "一二三四五六七八九十",
    "赵",
    "女",
    "吕布",
    "绿",
};

constexpr const char* SURNAMES[] = {
    "王", "李", "张", "刘", "陈", "杨", "赵", "黄", "周", "吴", "徐", "孙", "胡", "朱", "高",
    "林", "何", "郭", "马", "罗", "梁", "宋", "郑", "谢", "韩", "唐", "冯", "于", "董", "萧",
    "程", "曹", "袁", "邓", "许", "傅", "沈", "曾", "彭", "吕", "苏", "卢", "蒋", "蔡", "贾",
    "丁", "魏", "薛", "叶", "阎", "余", "潘", "杜", "戴", "夏", "钟", "汪", "田", "任", "姜",
    "范", "方", "石", "姚", "谭", "廖", "邹", "熊", "金", "陆", "郝", "孔", "白", "崔", "康",
};

constexpr const char* POLYPHONIC_SURNAMES[] = {
    "单", "曾", "解", "仇", "查", "区", "朴", "任", "乐",   "盖",   "华",
    "翟", "覃", "种", "宁", "纪", "葛", "燕", "召", "尉迟", "长孙", "万俟",
};

constexpr const char* TRADITIONAL_SURNAMES[] = {
    "張", "劉", "陳", "楊", "趙", "黃", "吳", "孫", "馬", "羅", "鄭",   "謝",   "韓",   "馮",
    "蕭", "葉", "許", "鄧", "蔣", "賈", "閻", "鍾", "陸", "龔", "歐陽", "諸葛", "司馬", "東方",
};

constexpr const char* GIVEN_NAMES[] = {
    "伟",   "芳",   "娜",   "敏",   "静",   "丽",   "强",   "磊",   "军",   "洋",
    "勇",   "艳",   "杰",   "娟",   "涛",   "明",   "超",   "兰",   "霞",   "平",
    "刚",   "辉",   "玲",   "红",   "云",   "建国", "志强", "晓东", "文博", "子涵",
    "雨桐", "梓萱", "浩然", "欣怡", "宇轩", "思远", "海燕", "春梅", "国庆", "秀英",
    "桂兰", "玉珍", "长江", "重庆", "乐天", "朝阳", "行远", "中和", "少华", "宁宁",
};

constexpr const char* TRADITIONAL_GIVEN_NAMES[] = {
    "偉",   "靜",   "麗",   "強",   "軍",   "艷",   "傑",   "濤",   "蘭",   "輝",   "紅",   "雲",
    "建國", "曉東", "國慶", "學友", "德華", "麗君", "樂天", "長江", "寶玉", "鳳嬌", "龍飛", "愛華",
};

constexpr const char* LATIN_FIRST_NAMES[] = {
    "Adam",   "Bella", "Carlos", "Diana",  "Emma",  "Frank",  "Grace",  "Henry",   "Irene",
    "Jack",   "Kevin", "Lucy",   "Maria",  "Nina",  "Oscar",  "Paula",  "Quentin", "Rosa",
    "Steven", "Tina",  "Uma",    "Victor", "Wendy", "Xavier", "Yvonne", "Zack",
};

constexpr const char* LATIN_LAST_NAMES[] = {
    "Wang",   "Chen",  "Lee",     "Smith",  "Brown", "Miller",  "Garcia", "Novak", "Rossi", "Kim",
    "Tanaka", "Jones", "Fischer", "Dubois", "Silva", "Ivanova", "Young",  "Hill",  "Baker",
};

constexpr const char* MIXED_PREFIXES[] = {"小", "老", "阿", "A", "B2", "VIP", "001", "3楼"};
constexpr const char* MIXED_SUFFIXES[] = {"总",      "老师", "医生", "经理",
                                          " (home)", "2",    "Jr",   "快递"};

// Scatters the index, so that consecutive names differ.
uint32_t Scatter(int iIndex, uint32_t uSalt)
{
    uint32_t uValue = static_cast<uint32_t>(iIndex) * 2654435761U + uSalt * 40503U;
    uValue ^= uValue >> 15U;
    uValue *= 2246822519U;
    return uValue ^ (uValue >> 13U);
}

template <size_t N>
std::string Pick(const char* const (&aszList)[N], int iIndex, uint32_t uSalt)
{
    return aszList[Scatter(iIndex, uSalt) % N];
}

std::string LatinName(int iIndex)
{
    return Pick(LATIN_FIRST_NAMES, iIndex, 1) + " " + Pick(LATIN_LAST_NAMES, iIndex, 2);
}

std::string MixedName(int iIndex)
{
    const std::string strSurname = Pick(SURNAMES, iIndex, 3);
    return iIndex % 3 == 0 ? Pick(MIXED_PREFIXES, iIndex, 4) + strSurname
                           : strSurname + Pick(MIXED_SUFFIXES, iIndex, 5);
}

// Six of ten are plain; the other kinds take turns.
std::string ComposedName(int iIndex)
{
    switch (iIndex % 10)
    {
    case 2:
        return Pick(POLYPHONIC_SURNAMES, iIndex, 6) + Pick(GIVEN_NAMES, iIndex, 7);
    case 4:
        return Pick(TRADITIONAL_SURNAMES, iIndex, 8) + Pick(TRADITIONAL_GIVEN_NAMES, iIndex, 9);
    case 6:
        return LatinName(iIndex);
    case 8:
        return MixedName(iIndex);
    default:
        return Pick(SURNAMES, iIndex, 10) + Pick(GIVEN_NAMES, iIndex, 11);
    }
}

} // namespace

std::string SampleName(int iIndex)
{
    constexpr int PICKED = static_cast<int>(std::size(PICKED_NAMES));
    return iIndex < PICKED ? PICKED_NAMES[iIndex] : ComposedName(iIndex);
}
