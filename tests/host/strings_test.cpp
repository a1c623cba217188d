#include <gtest/gtest.h>

#include <string>

#include <utils/String16.h>
#include <utils/String8.h>

namespace {

using android::String16;
using android::String8;

TEST(Strings, ConvertBetweenTheTwoFormsReplacingWhatIsNoText) {
  struct Case {
    std::string utf8;
    std::u16string utf16;
    std::string back;
  };
  const Case cases[] = {
      {"media.player", u"media.player", "media.player"},
      {"", u"", ""},
      {"\xC3\xA9\xE2\x82\xAC\xF0\x9F\x8E\xA5", u"\u00E9\u20AC\U0001F3A5",
       "\xC3\xA9\xE2\x82\xAC\xF0\x9F\x8E\xA5"},
      {"a\xFFz", u"a\uFFFDz", "a\xEF\xBF\xBDz"},                     // no such first byte
      {"a\xE2\x82", u"a\uFFFD\uFFFD", "a\xEF\xBF\xBD\xEF\xBF\xBD"},  // cut off
      {"\xC0\x80", u"\uFFFD\uFFFD", "\xEF\xBF\xBD\xEF\xBF\xBD"},     // longer than need be
      {"\xED\xA0\x80", u"\uFFFD\uFFFD\uFFFD",                        // half a pair
       "\xEF\xBF\xBD\xEF\xBF\xBD\xEF\xBF\xBD"},
      {"\xF4\x90\x80\x80z", u"\uFFFD\uFFFD\uFFFD\uFFFDz",  // beyond the last character
       "\xEF\xBF\xBD\xEF\xBF\xBD\xEF\xBF\xBD\xEF\xBF\xBDz"},
  };
  for (const Case& each : cases) {
    const String16 wide(each.utf8.c_str());
    EXPECT_EQ(std::u16string(wide.string(), wide.size()), each.utf16) << each.utf8;
    EXPECT_EQ(String8(wide), each.back.c_str());
    EXPECT_EQ(String16(String8(each.utf8.c_str())), wide);
  }
  const char16_t halves[] = {u'a', 0xD83C, u'b', 0xDFA5, 0};
  EXPECT_EQ(String8(halves),
            "a\xEF\xBF\xBD"
            "b\xEF\xBF\xBD");
  EXPECT_EQ(String8(halves, 2), "a\xEF\xBF\xBD");
}

TEST(Strings, CompareByBytesAndGrowAlsoFromTheirOwnText) {
  EXPECT_TRUE(String8("AVC") < String8("avc") && String8("avc") < "\xC3\xA9");
  EXPECT_TRUE(String8(static_cast<const char*>(nullptr)).isEmpty());
  String8 text("OMX");
  text.append(".qcom.more", 5);
  text += "!";
  EXPECT_EQ(text + String8("?") + "#", "OMX.qcom!?#");
  EXPECT_EQ(text.find("qcom"), 4);
  EXPECT_EQ(text.find("qcom", 5), -1);
  text.append(text.string() + 3);
  EXPECT_EQ(text, "OMX.qcom!.qcom!");
  text.appendFormat(" %s %d", text.string(), 7);
  EXPECT_EQ(text, "OMX.qcom!.qcom! OMX.qcom!.qcom! 7");
  text.setTo(text.string() + 26);
  EXPECT_EQ(text, "qcom! 7");
  EXPECT_EQ(String8::format("%0200d", 1).size(), 200U);
}

}  // namespace
