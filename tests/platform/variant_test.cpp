// VARIANT, BSTR and SAFEARRAY basics.
#include <utility>

#include <gtest/gtest.h>

#include <ut/platform/variant.h>

namespace {

TEST(Bstr, KnowsItsLengthAndKeepsEmbeddedZeros) {
    ut::UniqueBstr text(SysAllocStringLen(L"a\0b", 3));
    ASSERT_TRUE(text);
    EXPECT_EQ(SysStringLen(text.get()), 3u);
    EXPECT_EQ(SysStringByteLen(text.get()), 3u * sizeof(OLECHAR));
    EXPECT_EQ(text.get()[1], L'\0');
    EXPECT_EQ(text.get()[3], L'\0');
    EXPECT_EQ(SysStringLen(nullptr), 0u);
    EXPECT_EQ(SysAllocString(nullptr), nullptr);
    ut::UniqueBstr odd(SysAllocStringByteLen("abc", 3));
    EXPECT_EQ(SysStringByteLen(odd.get()), 3u);
}

TEST(Variant, CopyDuplicatesStringsAndArrays) {
    ut::Variant source, copy;
    source->vt = VT_BSTR;
    source->bstrVal = SysAllocString(L"scene");
    ASSERT_EQ(VariantCopy(copy.Get(), source.Get()), S_OK);
    EXPECT_NE(copy->bstrVal, source->bstrVal);
    EXPECT_STREQ(copy->bstrVal, L"scene");

    ut::Variant array, arrayCopy;
    array->vt = VT_ARRAY | VT_R8;
    array->parray = SafeArrayCreateVector(VT_R8, 0, 3);
    ASSERT_NE(array->parray, nullptr);
    double* data = nullptr;
    ASSERT_EQ(SafeArrayAccessData(array->parray, reinterpret_cast<void**>(&data)), S_OK);
    data[2] = 2.5;
    ASSERT_EQ(SafeArrayUnaccessData(array->parray), S_OK);
    ASSERT_EQ(VariantCopy(arrayCopy.Get(), array.Get()), S_OK);
    EXPECT_NE(arrayCopy->parray, array->parray);
    EXPECT_EQ(static_cast<double*>(arrayCopy->parray->pvData)[2], 2.5);
}

TEST(SafeArray, ReportsBoundsPerDimensionLeftMostFirst) {
    SAFEARRAYBOUND bounds[2] = {{3, 1}, {5, -2}};
    ut::UniqueSafeArray array(SafeArrayCreate(VT_I4, 2, bounds));
    ASSERT_TRUE(array);
    LONG low = 0, high = 0;
    const std::pair<UINT, std::pair<LONG, LONG>> dimensions[] = {{1, {1, 3}}, {2, {-2, 2}}};
    for (const auto& [dimension, expected] : dimensions) {
        ASSERT_EQ(SafeArrayGetLBound(array.get(), dimension, &low), S_OK);
        ASSERT_EQ(SafeArrayGetUBound(array.get(), dimension, &high), S_OK);
        EXPECT_EQ(std::pair(low, high), expected) << dimension;
    }
    EXPECT_EQ(SafeArrayGetLBound(array.get(), 3, &low), DISP_E_BADINDEX);
    VARTYPE type = VT_EMPTY;
    ASSERT_EQ(SafeArrayGetVartype(array.get(), &type), S_OK);
    EXPECT_EQ(type, VT_I4);
    EXPECT_EQ(SafeArrayGetElemsize(array.get()), 4u);
}

TEST(SafeArray, ALockedArrayIsNotDestroyed) {
    SAFEARRAY* array = SafeArrayCreateVector(VT_BSTR, 0, 2);
    ASSERT_NE(array, nullptr);
    static_cast<BSTR*>(array->pvData)[0] = SysAllocString(L"owned");
    void* data = nullptr;
    ASSERT_EQ(SafeArrayAccessData(array, &data), S_OK);
    EXPECT_TRUE(FAILED(SafeArrayDestroy(array)));
    ASSERT_EQ(SafeArrayUnaccessData(array), S_OK);
    EXPECT_EQ(SafeArrayDestroy(array), S_OK); // frees the element string too (LeakSanitizer checks)
}

} // namespace
