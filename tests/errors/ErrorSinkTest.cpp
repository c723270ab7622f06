#include <gtest/gtest.h>

#include <string>

#include "errors/ErrorSink.h"

TEST(ErrorSinkContract, StartsEmptyAndAtPositionZero)
{
    ErrorSink sink;
    EXPECT_EQ(sink.GetValue(), 0);
    EXPECT_EQ(sink.GetPosition(), 0);
    EXPECT_STREQ(sink.GetText(), "");
}

TEST(ErrorSinkContract, ResetKeepsTheTextAndNullTextKeepsTheEarlierOne)
{
    ErrorSink sink;
    sink.SetError(16, 42, "count");
    EXPECT_EQ(sink.GetValue(), 16);
    EXPECT_EQ(sink.GetPosition(), 42);
    sink.Reset();
    EXPECT_EQ(sink.GetValue(), 0);
    EXPECT_EQ(sink.GetPosition(), 0);
    EXPECT_STREQ(sink.GetText(), "count");
    sink.SetError(1, 7, nullptr);
    EXPECT_EQ(sink.GetPosition(), 7);
    EXPECT_STREQ(sink.GetText(), "count");
}

TEST(ErrorSinkContract, CutsALongTextTo255Characters)
{
    ErrorSink sink;
    const std::string longText(1000, 'x');
    sink.SetError(1, 0, longText.c_str());
    EXPECT_EQ(std::string(sink.GetText()), std::string(255, 'x'));
}

TEST(ErrorSinkContract, ServesThroughTheInterfaceTable)
{
    ErrorSink sink;
    IError& asInterface = sink;
    asInterface.SetError(3, 9, "name");
    EXPECT_EQ(asInterface.GetPosition(), 9);
    EXPECT_STREQ(asInterface.GetText(), "name");
}
