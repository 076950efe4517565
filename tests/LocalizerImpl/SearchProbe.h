#ifndef QV_TESTS_LOCALIZERIMPL_SEARCHPROBE_H
#define QV_TESTS_LOCALIZERIMPL_SEARCHPROBE_H

#include "LocalizerImpl/QVLocalizerManager.h"

#include <gtest/gtest.h>

#include <functional>
#include <string>
#include <utility>

// What a search tells besides its matches: the keys that may follow, '#' for the key of other
// characters, and the candidate characters.
using Findings = std::pair<std::string, std::wstring>;

// A matcher that runs a test's body while a search is under way: what the body adds to the mask
// and to the candidate characters can be seen nowhere but in the outcome of that search. The
// search itself, iInputLen times 'a' on a name of as many letters a, adds nothing.
template <class TMatcher>
class CSearchProbe : public TMatcher
{
public:
    explicit CSearchProbe(int bMatchAnywhere = 1) : TMatcher(bMatchAnywhere) {}

    Findings Run(int iInputLen, const std::function<void()>& fnBody)
    {
        m_fnBody = fnBody;
        std::wstring strInput(static_cast<size_t>(iInputLen), L'a');
        tag_LocalizerDetail name = {};
        std::fill_n(name.szLocalizerKey, iInputLen, LOC_ALPHA_BASE);
        tag_LocalizerDetail found = {};
        tag_LocalizerResult candidates = {1, &name};
        tag_LocalizerResult result = {0, &found};
        long lMask = 0;
        wchar_t szWords[CN_WORD_MAX + 1] = {};
        EXPECT_EQ(this->DoSearch(&candidates, strInput.data(), IME_SEARCH_WORD, 0, &result, &lMask,
                                 szWords),
                  0);
        EXPECT_FALSE(m_fnBody) << "the search asked the matcher nothing";
        Findings findings = {{}, szWords};
        for (int i = 0; i <= LOC_ALPHA_COUNT; ++i)
        {
            findings.first +=
                (lMask >> i) & 1 ? std::string(1, "abcdefghijklmnopqrstuvwxyz#"[i]) : std::string();
        }
        return findings;
    }

    int CmpEnglishWords(unsigned short code, wchar_t* szPiece) override
    {
        RunBody();
        return TMatcher::CmpEnglishWords(code, szPiece);
    }
    int IsValid(android::Vector<wchar_t*>& vPieces) override
    {
        RunBody();
        return TMatcher::IsValid(vPieces);
    }

private:
    void RunBody()
    {
        const std::function<void()> fnBody = std::exchange(m_fnBody, nullptr);
        if (fnBody)
        {
            fnBody();
        }
    }

    std::function<void()> m_fnBody;
};

#endif
