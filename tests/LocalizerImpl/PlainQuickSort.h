#ifndef QV_TESTS_LOCALIZERIMPL_PLAINQUICKSORT_H
#define QV_TESTS_LOCALIZERIMPL_PLAINQUICKSORT_H

// The quicksort of the ranking, written plainly: around the first entry of v[iLow]..v[iHigh]. Equal
// entries end where it happens to leave them.
template <class T, class TBefore>
void PlainQuickSort(T* v, int iLow, int iHigh, const TBefore& before)
{
    if (iLow >= iHigh)
    {
        return;
    }
    const T pivot = v[iLow];
    int i = iLow;
    int j = iHigh;
    while (i < j)
    {
        while (j > i && !before(v[j], pivot))
        {
            --j;
        }
        if (j > i)
        {
            v[i++] = v[j];
        }
        while (i < j && !before(pivot, v[i]))
        {
            ++i;
        }
        if (i < j)
        {
            v[j--] = v[i];
        }
    }
    v[i] = pivot;
    PlainQuickSort(v, iLow, i - 1, before);
    PlainQuickSort(v, i + 1, iHigh, before);
}

#endif
