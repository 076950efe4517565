// The native half of org.qvlocalize: converts strings between UTF-16 and UTF-8, arrays, and results
// to exceptions. It has no state between calls.

#include "bindings/c/qvlocalize.h"
#include "org_qvlocalize_Index.h"
#include "org_qvlocalize_Result.h"

#include <cstring>
#include <memory>
#include <new>

// A Java array of pairs of ints is used as an array of filters.
static_assert(sizeof(qv_filter) == 2 * sizeof(jint), "kind and id");
static_assert(sizeof(qv_section) == 3 * sizeof(jint), "label, first and count");
static_assert(sizeof(jlong) == sizeof(int64_t), "ids are passed on as they are");

namespace
{

constexpr jchar FIRST_HIGH_SURROGATE = 0xD800;
constexpr jchar FIRST_LOW_SURROGATE = 0xDC00;
constexpr jchar LAST_SURROGATE = 0xDFFF;
constexpr uint32_t FIRST_SUPPLEMENTARY = 0x10000;
constexpr int SURROGATE_BITS = 10;

constexpr size_t BYTES_PER_UNIT = 3; // a pair of surrogates takes four
constexpr jsize SHORT_TEXT = 64;     // units that need no allocation
constexpr jsize FEW_FILTERS = 16;    // filters that need none

void ThrowNew(JNIEnv* pEnv, const char* szClass, const char* szWords)
{
    const jclass type = pEnv->FindClass(szClass);
    if (type != nullptr)
    {
        pEnv->ThrowNew(type, szWords);
    }
}

// True for QV_OK and above; else false with a QvException pending.
bool Check(JNIEnv* pEnv, int iStatus)
{
    if (iStatus >= 0)
    {
        return true;
    }
    const jclass type = pEnv->FindClass("org/qvlocalize/QvException");
    if (type == nullptr)
    {
        return false;
    }
    const jmethodID constructor = pEnv->GetMethodID(type, "<init>", "(ILjava/lang/String;)V");
    if (constructor == nullptr)
    {
        return false;
    }
    const jstring words = pEnv->NewStringUTF(qv_strerror(iStatus));
    if (words == nullptr)
    {
        return false;
    }
    const jobject exception = pEnv->NewObject(type, constructor, iStatus, words);
    if (exception != nullptr)
    {
        pEnv->Throw(static_cast<jthrowable>(exception));
    }
    return false;
}

bool IsSurrogate(jchar unit)
{
    return unit >= FIRST_HIGH_SURROGATE && unit <= LAST_SURROGATE;
}

// Encodes a character; returns the place after it.
char* Append(uint32_t uCharacter, char* pTarget)
{
    const auto continuation = [uCharacter](int iShift)
    { return static_cast<char>(0x80U | ((uCharacter >> iShift) & 0x3FU)); };
    if (uCharacter < 0x80)
    {
        *pTarget++ = static_cast<char>(uCharacter);
        return pTarget;
    }
    if (uCharacter < 0x800)
    {
        *pTarget++ = static_cast<char>(0xC0U | (uCharacter >> 6));
    }
    else if (uCharacter < FIRST_SUPPLEMENTARY)
    {
        *pTarget++ = static_cast<char>(0xE0U | (uCharacter >> 12));
        *pTarget++ = continuation(6);
    }
    else
    {
        *pTarget++ = static_cast<char>(0xF0U | (uCharacter >> 18));
        *pTarget++ = continuation(12);
        *pTarget++ = continuation(6);
    }
    *pTarget++ = continuation(0);
    return pTarget;
}

// Encodes iUnits of UTF-16 with a terminator; false for half a surrogate pair and a null character,
// which would end the text.
bool Encode(const jchar* pUnits, jsize iUnits, char* pTarget)
{
    for (jsize i = 0; i < iUnits; ++i)
    {
        uint32_t uCharacter = pUnits[i];
        if (IsSurrogate(pUnits[i]))
        {
            const bool bPair = pUnits[i] < FIRST_LOW_SURROGATE && i + 1 < iUnits &&
                               IsSurrogate(pUnits[i + 1]) && pUnits[i + 1] >= FIRST_LOW_SURROGATE;
            if (!bPair)
            {
                return false;
            }
            ++i;
            uCharacter = FIRST_SUPPLEMENTARY +
                         ((uCharacter - FIRST_HIGH_SURROGATE) << SURROGATE_BITS) +
                         (pUnits[i] - static_cast<uint32_t>(FIRST_LOW_SURROGATE));
        }
        if (uCharacter == 0)
        {
            return false;
        }
        pTarget = Append(uCharacter, pTarget);
    }
    *pTarget = 0;
    return true;
}

// A Java string in UTF-8.
class CText
{
public:
    // If Get returns null, an exception is pending.
    CText(JNIEnv* pEnv, jstring text)
    {
        if (text == nullptr)
        {
            ThrowNew(pEnv, "java/lang/NullPointerException", "the text is null");
            return;
        }
        const jsize iUnits = pEnv->GetStringLength(text);
        const size_t uUnits = static_cast<size_t>(iUnits);
        jchar* pUnits = m_aUnits;
        char* pBytes = m_aBytes;
        if (iUnits > SHORT_TEXT)
        {
            m_units.reset(new (std::nothrow) jchar[uUnits]);
            m_bytes.reset(new (std::nothrow) char[uUnits * BYTES_PER_UNIT + 1]);
            pUnits = m_units.get();
            pBytes = m_bytes.get();
        }
        if (pUnits == nullptr || pBytes == nullptr)
        {
            Check(pEnv, QV_ERROR_MEMORY);
            return;
        }
        pEnv->GetStringRegion(text, 0, iUnits, pUnits);
        if (!Encode(pUnits, iUnits, pBytes))
        {
            ThrowNew(pEnv, "java/lang/IllegalArgumentException",
                     "the text has half a surrogate pair or a null character");
            return;
        }
        m_szText = pBytes;
    }
    CText(const CText&) = delete;
    CText& operator=(const CText&) = delete;

    const char* Get() const { return m_szText; }

private:
    const char* m_szText = nullptr;
    jchar m_aUnits[SHORT_TEXT];
    char m_aBytes[SHORT_TEXT * BYTES_PER_UNIT + 1];
    std::unique_ptr<jchar[]> m_units;
    std::unique_ptr<char[]> m_bytes;
};

// A Java string of the library's text, which is short and well-formed; null with an exception
// pending.
jstring NewString(JNIEnv* pEnv, const char* szText)
{
    jchar aUnits[SHORT_TEXT];
    jsize iUnits = 0;
    const unsigned char* pBytes = reinterpret_cast<const unsigned char*>(szText);
    while (*pBytes != 0 && iUnits < SHORT_TEXT - 1)
    {
        const unsigned uLead = *pBytes++;
        const int iMore = uLead < 0x80 ? 0 : uLead < 0xE0 ? 1 : uLead < 0xF0 ? 2 : 3;
        uint32_t uCharacter = iMore == 0 ? uLead : uLead & (0x3FU >> iMore);
        for (int i = 0; i < iMore; ++i)
        {
            uCharacter = (uCharacter << 6) | (*pBytes++ & 0x3FU);
        }
        if (uCharacter >= FIRST_SUPPLEMENTARY)
        {
            uCharacter -= FIRST_SUPPLEMENTARY;
            aUnits[iUnits++] =
                static_cast<jchar>(FIRST_HIGH_SURROGATE + (uCharacter >> SURROGATE_BITS));
            uCharacter = FIRST_LOW_SURROGATE + (uCharacter & ((1U << SURROGATE_BITS) - 1));
        }
        aUnits[iUnits++] = static_cast<jchar>(uCharacter);
    }
    return pEnv->NewString(aUnits, iUnits);
}

qv_index* IndexOf(jlong llHandle)
{
    return reinterpret_cast<qv_index*>(static_cast<intptr_t>(llHandle));
}

qv_result* ResultOf(jlong llHandle)
{
    return reinterpret_cast<qv_result*>(static_cast<intptr_t>(llHandle));
}

jlong HandleOf(const void* pObject)
{
    return static_cast<jlong>(reinterpret_cast<intptr_t>(pObject));
}

// The filters of a Java array of kinds and ids, null for none.
class CFilters
{
public:
    CFilters(JNIEnv* pEnv, jintArray pairs)
    {
        m_iCount = pairs != nullptr ? pEnv->GetArrayLength(pairs) / 2 : 0;
        if (m_iCount > FEW_FILTERS)
        {
            m_many.reset(new (std::nothrow) qv_filter[static_cast<size_t>(m_iCount)]);
            m_pFilters = m_many.get();
        }
        if (m_pFilters == nullptr)
        {
            Check(pEnv, QV_ERROR_MEMORY);
        }
        else if (m_iCount > 0)
        {
            pEnv->GetIntArrayRegion(pairs, 0, 2 * m_iCount, reinterpret_cast<jint*>(m_pFilters));
        }
    }
    CFilters(const CFilters&) = delete;
    CFilters& operator=(const CFilters&) = delete;

    // Null with an exception pending.
    const qv_filter* Get() const { return m_pFilters; }
    size_t Count() const { return static_cast<size_t>(m_iCount); }

private:
    jsize m_iCount = 0;
    qv_filter m_aFew[FEW_FILTERS];
    std::unique_ptr<qv_filter[]> m_many;
    qv_filter* m_pFilters = m_aFew;
};

// The names of a Java array in UTF-8; false with an exception pending.
bool LoadNames(JNIEnv* pEnv, jobjectArray names, jsize iCount, std::unique_ptr<char[]>* pTexts,
               const char** pszTexts)
{
    for (jsize i = 0; i < iCount; ++i)
    {
        const jstring name = static_cast<jstring>(pEnv->GetObjectArrayElement(names, i));
        const CText text(pEnv, name);
        pEnv->DeleteLocalRef(name);
        if (text.Get() == nullptr)
        {
            return false;
        }
        const size_t uBytes = std::strlen(text.Get()) + 1;
        pTexts[i].reset(new (std::nothrow) char[uBytes]);
        if (pTexts[i] == nullptr)
        {
            return Check(pEnv, QV_ERROR_MEMORY);
        }
        pszTexts[i] = static_cast<const char*>(std::memcpy(pTexts[i].get(), text.Get(), uBytes));
    }
    return true;
}

jobjectArray NewStrings(JNIEnv* pEnv, const char (*pszTexts)[QV_KEY_SIZE], jsize iCount)
{
    const jclass type = pEnv->FindClass("java/lang/String");
    const jobjectArray strings =
        type != nullptr ? pEnv->NewObjectArray(iCount, type, nullptr) : nullptr;
    for (jsize i = 0; strings != nullptr && i < iCount; ++i)
    {
        const jstring text = NewString(pEnv, pszTexts[i]);
        if (text == nullptr)
        {
            return nullptr;
        }
        pEnv->SetObjectArrayElement(strings, i, text);
        pEnv->DeleteLocalRef(text);
    }
    return strings;
}

} // namespace

jlong Java_org_qvlocalize_Index_open(JNIEnv* pEnv, jclass /*type*/, jstring directory)
{
    qv_index* pIndex = nullptr;
    if (directory == nullptr)
    {
        Check(pEnv, qv_open(nullptr, &pIndex));
        return HandleOf(pIndex);
    }
    const CText text(pEnv, directory);
    if (text.Get() != nullptr)
    {
        Check(pEnv, qv_open(text.Get(), &pIndex));
    }
    return HandleOf(pIndex);
}

void Java_org_qvlocalize_Index_close(JNIEnv* /*pEnv*/, jclass /*type*/, jlong index)
{
    qv_close(IndexOf(index));
}

jboolean Java_org_qvlocalize_Index_needsBuild(JNIEnv* pEnv, jclass /*type*/, jlong index)
{
    const int iNeeds = qv_needs_build(IndexOf(index));
    return Check(pEnv, iNeeds) && iNeeds != 0 ? JNI_TRUE : JNI_FALSE;
}

void Java_org_qvlocalize_Index_build(JNIEnv* pEnv, jclass /*type*/, jlong index, jboolean force)
{
    Check(pEnv, qv_build(IndexOf(index), force != JNI_FALSE ? 1 : 0));
}

jlong Java_org_qvlocalize_Index_search(JNIEnv* pEnv, jclass /*type*/, jlong index, jstring typed,
                                       jint kind, jintArray pairs, jlong previous)
{
    const CText text(pEnv, typed);
    if (text.Get() == nullptr)
    {
        return 0;
    }
    const CFilters filters(pEnv, pairs);
    if (filters.Get() == nullptr)
    {
        return 0;
    }
    const qv_query query = {text.Get(), kind, filters.Get(), filters.Count()};
    qv_result* pResult = nullptr;
    Check(pEnv, qv_search(IndexOf(index), &query, ResultOf(previous), &pResult));
    return HandleOf(pResult);
}

jobjectArray Java_org_qvlocalize_Index_localizerKeys(JNIEnv* pEnv, jclass /*type*/, jlong index,
                                                     jobjectArray names)
{
    const jsize iCount = pEnv->GetArrayLength(names);
    const size_t uCount = static_cast<size_t>(iCount);
    const std::unique_ptr<std::unique_ptr<char[]>[]> texts(new (std::nothrow)
                                                               std::unique_ptr<char[]>[uCount]);
    const std::unique_ptr<const char*[]> pointers(new (std::nothrow) const char*[uCount]);
    const std::unique_ptr<char[][QV_KEY_SIZE]> keys(new (std::nothrow) char[uCount][QV_KEY_SIZE]);
    if (texts == nullptr || pointers == nullptr || keys == nullptr)
    {
        Check(pEnv, QV_ERROR_MEMORY);
        return nullptr;
    }
    if (!LoadNames(pEnv, names, iCount, texts.get(), pointers.get()) ||
        !Check(pEnv, qv_localizer_keys(IndexOf(index), pointers.get(), uCount, keys.get())))
    {
        return nullptr;
    }
    return NewStrings(pEnv, keys.get(), iCount);
}

jstring Java_org_qvlocalize_Index_pick(JNIEnv* pEnv, jclass /*type*/, jlong index, jstring typed,
                                       jint position, jstring picked)
{
    const CText text(pEnv, typed);
    if (text.Get() == nullptr)
    {
        return nullptr;
    }
    const CText word(pEnv, picked);
    if (word.Get() == nullptr)
    {
        return nullptr;
    }
    char szOut[QV_PICK_SIZE];
    const int iStatus =
        qv_pick(IndexOf(index), text.Get(), position, word.Get(), szOut, sizeof(szOut));
    return Check(pEnv, iStatus) ? NewString(pEnv, szOut) : nullptr;
}

void Java_org_qvlocalize_Index_contactsChanged(JNIEnv* pEnv, jclass /*type*/, jlong index,
                                               jlongArray ids)
{
    const jsize iCount = pEnv->GetArrayLength(ids);
    const size_t uCount = static_cast<size_t>(iCount);
    const std::unique_ptr<jlong[]> copy(new (std::nothrow) jlong[uCount]);
    const std::unique_ptr<int64_t[]> list(new (std::nothrow) int64_t[uCount]);
    if (copy == nullptr || list == nullptr)
    {
        Check(pEnv, QV_ERROR_MEMORY);
        return;
    }
    pEnv->GetLongArrayRegion(ids, 0, iCount, copy.get());
    std::memcpy(list.get(), copy.get(), uCount * sizeof(jlong));
    Check(pEnv, qv_contacts_changed(IndexOf(index), list.get(), uCount));
}

void Java_org_qvlocalize_Index_allContactsChanged(JNIEnv* pEnv, jclass /*type*/, jlong index)
{
    Check(pEnv, qv_all_contacts_changed(IndexOf(index)));
}

void Java_org_qvlocalize_Index_statusChanged(JNIEnv* pEnv, jclass /*type*/, jlong index)
{
    Check(pEnv, qv_status_changed(IndexOf(index)));
}

void Java_org_qvlocalize_Index_timeChanged(JNIEnv* pEnv, jclass /*type*/, jlong index, jint contact,
                                           jlong time)
{
    Check(pEnv, qv_time_changed(IndexOf(index), contact, time));
}

void Java_org_qvlocalize_Index_starChanged(JNIEnv* pEnv, jclass /*type*/, jlong index, jint contact,
                                           jboolean starred)
{
    Check(pEnv, qv_star_changed(IndexOf(index), contact, starred != JNI_FALSE ? 1 : 0));
}

jint Java_org_qvlocalize_Index_sortType(JNIEnv* pEnv, jclass /*type*/, jlong index)
{
    const int iSortType = qv_get_sort_type(IndexOf(index));
    return Check(pEnv, iSortType) ? iSortType : 0;
}

void Java_org_qvlocalize_Index_setSortType(JNIEnv* pEnv, jclass /*type*/, jlong index,
                                           jint sortType)
{
    Check(pEnv, qv_set_sort_type(IndexOf(index), sortType));
}

jobject Java_org_qvlocalize_Result_matches(JNIEnv* pEnv, jclass /*type*/, jlong result)
{
    const qv_match* pMatches = qv_result_matches(ResultOf(result));
    if (pMatches == nullptr)
    {
        return nullptr;
    }
    // The Java class only reads the buffer.
    return pEnv->NewDirectByteBuffer(
        const_cast<qv_match*>(pMatches),
        static_cast<jlong>(qv_result_count(ResultOf(result)) * sizeof(qv_match)));
}

void Java_org_qvlocalize_Result_free(JNIEnv* /*pEnv*/, jclass /*type*/, jlong result)
{
    qv_result_free(ResultOf(result));
}

jint Java_org_qvlocalize_Result_find(JNIEnv* /*pEnv*/, jclass /*type*/, jlong result, jint contact)
{
    return static_cast<jint>(qv_result_find(ResultOf(result), contact));
}

jint Java_org_qvlocalize_Result_nextKeys(JNIEnv* /*pEnv*/, jclass /*type*/, jlong result)
{
    return static_cast<jint>(qv_next_keys(ResultOf(result)));
}

jstring Java_org_qvlocalize_Result_candidates(JNIEnv* pEnv, jclass /*type*/, jlong result)
{
    return NewString(pEnv, qv_candidates(ResultOf(result)));
}

jintArray Java_org_qvlocalize_Result_sections(JNIEnv* pEnv, jclass /*type*/, jlong result)
{
    constexpr jsize FIELDS = sizeof(qv_section) / sizeof(jint);
    qv_section aSections[QV_MAX_SECTIONS];
    const jsize iCount = static_cast<jsize>(qv_result_sections(ResultOf(result), aSections));
    const jintArray fields = pEnv->NewIntArray(iCount * FIELDS);
    if (fields != nullptr)
    {
        pEnv->SetIntArrayRegion(fields, 0, iCount * FIELDS, reinterpret_cast<jint*>(aSections));
    }
    return fields;
}
