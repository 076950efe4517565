#include "bench/NameSource.h"

#include <cwchar>
#include <iterator>

namespace
{

// Surnames with their share of the population in units of 0.01 %, after the published census
// figures; the tail shares what is left.
struct tag_Surname
{
    wchar_t character;
    uint32_t uShare;
};

constexpr tag_Surname SURNAMES[] = {
    {L'王', 725}, {L'李', 719}, {L'张', 683}, {L'刘', 538}, {L'陈', 453}, {L'杨', 308},
    {L'赵', 229}, {L'黄', 223}, {L'周', 212}, {L'吴', 205}, {L'徐', 167}, {L'孙', 154},
    {L'胡', 131}, {L'朱', 126}, {L'高', 121}, {L'林', 118}, {L'何', 117}, {L'郭', 115},
    {L'马', 105}, {L'罗', 86},  {L'梁', 84},  {L'宋', 81},  {L'郑', 78},  {L'谢', 72},
    {L'韩', 68},  {L'唐', 65},  {L'冯', 64},  {L'于', 62},  {L'董', 61},  {L'萧', 59},
    {L'程', 57},  {L'曹', 57},  {L'袁', 54},  {L'邓', 54},  {L'许', 54},  {L'傅', 51},
    {L'沈', 50},  {L'曾', 50},  {L'彭', 49},  {L'吕', 47},  {L'苏', 47},  {L'卢', 47},
    {L'蒋', 47},  {L'蔡', 46},  {L'贾', 42},  {L'丁', 42},  {L'魏', 41},  {L'薛', 40},
    {L'叶', 40},  {L'阎', 40}};

constexpr wchar_t RARE_SURNAMES[] =
    L"余潘杜戴夏钟汪田任姜范方石姚谭廖邹熊金陆郝孔白崔康毛邱秦江史顾侯邵孟龙万段雷钱汤尹黎易常武乔"
    L"贺赖龚文"
    L"单解仇朴查区盖覃尉翟阚冼逄褚宁华乐员种祭葛燕詹关洪翁柳祝欧温庄颜倪严牛岳齐沙聂章鲁葛韦";

constexpr wchar_t GIVEN[] = L"伟芳娜敏静秀丽强磊军洋艳勇杰娟涛明超霞平刚桂英华玉兰建国文红志春梅海"
                            L"峰丹萍鑫鹏飞宇浩晓婷雪琳博文欣怡"
                            L"子涵梓轩佳琪雨桐思源嘉怡俊豪宏立新民辉斌凯旋莉雅倩燕玲凤云龙庆福荣昌"
                            L"德仁义礼智信忠孝安康宁静远山川河"
                            L"江湖波浩然天成学习东南西北中正阳光耀祖光宗长兴旺盛达茂林森木松柏竹菊"
                            L"荷莲花香芬芳琴棋书画诗词歌赋乐行重";

constexpr const wchar_t* LATIN[] = {L"Anna",  L"Bob",   L"Chris", L"David", L"Emma",  L"Frank",
                                    L"Grace", L"Henry", L"Ivy",   L"Jack",  L"Kevin", L"Lisa",
                                    L"Mike",  L"Nina",  L"Oscar", L"Peter", L"Rose",  L"Smith",
                                    L"Tom",   L"Wang",  L"Zhang", L"Young", L"Zoe",   L"Lee"};

constexpr const wchar_t* PLACES[] = {L"北京", L"上海", L"重庆", L"西安", L"广州", L"深圳", L"长沙"};
constexpr const wchar_t* TRADES[] = {L"科技公司", L"物流中心", L"餐厅", L"医院",
                                     L"快递",     L"银行支行", L"4S店", L"便利店24小时"};

constexpr uint32_t SHARES = 10000;
constexpr uint32_t PERSONAL_PERCENT = 80;
constexpr uint32_t LATIN_PERCENT = 88;
constexpr uint32_t MIXED_PERCENT = 93;

} // namespace

uint32_t CNameSource::Below(uint32_t uLimit)
{
    constexpr uint64_t MULTIPLIER = 6364136223846793005ULL;
    constexpr uint64_t INCREMENT = 1442695040888963407ULL;
    m_uState = m_uState * MULTIPLIER + INCREMENT;
    return static_cast<uint32_t>(m_uState >> 33) % uLimit;
}

wchar_t CNameSource::Pick(const wchar_t* szCharacters, uint32_t uCount)
{
    return szCharacters[Below(uCount)];
}

wchar_t CNameSource::Surname()
{
    uint32_t uShare = Below(SHARES);
    for (const tag_Surname& surname : SURNAMES)
    {
        if (uShare < surname.uShare)
        {
            return surname.character;
        }
        uShare -= surname.uShare;
    }
    return Pick(RARE_SURNAMES, std::size(RARE_SURNAMES) - 1);
}

std::wstring CNameSource::NextOf(wchar_t surname)
{
    std::wstring strName(1, surname);
    strName += Pick(GIVEN, std::size(GIVEN) - 1);
    if (Below(5) != 0)
    {
        strName += Pick(GIVEN, std::size(GIVEN) - 1);
    }
    return strName;
}

std::wstring CNameSource::LatinName()
{
    std::wstring strName = LATIN[Below(std::size(LATIN))];
    strName += L' ';
    strName += LATIN[Below(std::size(LATIN))];
    return strName;
}

std::wstring CNameSource::CompanyName()
{
    std::wstring strName = PLACES[Below(std::size(PLACES))];
    strName += Pick(GIVEN, std::size(GIVEN) - 1);
    strName += Pick(GIVEN, std::size(GIVEN) - 1);
    return strName + TRADES[Below(std::size(TRADES))];
}

std::wstring CNameSource::Next()
{
    const uint32_t uKind = Below(100);
    if (uKind < PERSONAL_PERCENT)
    {
        return NextOf(Surname());
    }
    if (uKind < LATIN_PERCENT)
    {
        return LatinName();
    }
    if (uKind < MIXED_PERCENT)
    {
        return std::wstring(1, Surname()) + LATIN[Below(std::size(LATIN))];
    }
    return CompanyName();
}
