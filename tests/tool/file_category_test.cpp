#include "daemon/file_category.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <map>
#include <set>
#include <string>
#include <string_view>
#include <type_traits>
#include <vector>

namespace {

// The extensions that a query names, in its order.
std::vector<std::string> Terms(const std::string& query) {
  constexpr std::string_view kSeparator = " OR ";
  std::vector<std::string> terms;
  for (size_t at = 0;;) {
    const size_t end = query.find(kSeparator, at);
    terms.push_back(query.substr(at, end == std::string::npos ? end : end - at));
    if (end == std::string::npos) return terms;
    at = end + kSeparator.size();
  }
}

std::vector<std::string> Repeated(const std::vector<std::string>& terms) {
  std::set<std::string> seen;
  std::vector<std::string> repeated;
  for (const std::string& term : terms) {
    if (!seen.insert(term).second) repeated.push_back(term);
  }
  return repeated;
}

TEST(FileCategoryTest, IsAnOrderedMapOfFourQueries) {
  static_assert(
      std::is_same_v<std::remove_cv_t<decltype(FileCategoryMap)>, std::map<std::string, std::string>>);
  std::vector<std::string> names;
  names.reserve(FileCategoryMap.size());
  for (const auto& [name, query] : FileCategoryMap) names.push_back(name);
  EXPECT_EQ(names, (std::vector<std::string>{"audio", "document", "image", "video"}));
}

TEST(FileCategoryTest, NamesSoManyExtensions) {
  EXPECT_EQ(Terms(FileCategoryMap.at("document")).size(), 89U);
  EXPECT_EQ(Terms(FileCategoryMap.at("audio")).size(), 25U);
  EXPECT_EQ(Terms(FileCategoryMap.at("video")).size(), 31U);
  EXPECT_EQ(Terms(FileCategoryMap.at("image")).size(), 33U);
}

TEST(FileCategoryTest, KeepsTheTwoOdditiesThatTheDaemonKnows) {
  const std::vector<std::string> documents = Terms(FileCategoryMap.at("document"));
  EXPECT_EQ(std::count(documents.begin(), documents.end(), "msgc"), 1);
  EXPECT_EQ(std::count(documents.begin(), documents.end(), "msg"), 0);
  EXPECT_EQ(Repeated(documents), std::vector<std::string>{"cs"});
  for (const char* name : {"audio", "video", "image"}) {
    EXPECT_TRUE(Repeated(Terms(FileCategoryMap.at(name))).empty()) << name;
  }
}

TEST(FileCategoryTest, HoldsNothingButExtensionsAndSeparators) {
  for (const auto& [name, query] : FileCategoryMap) {
    for (const std::string& term : Terms(query)) {
      EXPECT_FALSE(term.empty()) << name;
      EXPECT_EQ(term.find_first_not_of("abcdefghijklmnopqrstuvwxyz0123456789-"), std::string::npos) << term;
    }
  }
}

TEST(FileCategoryTest, FindsEveryDocument) {
  EXPECT_EQ(FileCategoryMap.at("document"),
            "docx OR wri OR rtf OR xla OR xlb OR xlc OR xld OR xlk OR xll OR xlm OR xlt OR "
            "xlv OR xlw OR xlsx OR xlsm OR xlsb OR xltm OR xlam OR pptx OR pps OR ppsx OR "
            "pdf OR txt OR doc OR xls OR ppt OR odt OR ods OR odp OR odg OR odc OR odf OR "
            "odb OR odi OR odm OR ott OR ots OR otp OR otg OR otc OR otf OR oti OR oth OR "
            "potx OR pptm OR ppsm OR potm OR dotx OR dot OR pot OR ppa OR xltx OR docm OR "
            "dotm OR eml OR msgc OR c OR cc OR cpp OR cs OR cxx OR ada OR coffee OR cs OR "
            "css OR js OR json OR lisp OR markdown OR ocaml OR pl OR py OR rb OR sass OR "
            "scala OR r OR tex OR conf OR csv OR sub OR srt OR md OR log OR mobi OR azw3 OR "
            "pdb OR epub OR chm OR lit");
}

TEST(FileCategoryTest, FindsEveryAudioFile) {
  EXPECT_EQ(FileCategoryMap.at("audio"),
            "aac OR ac3 OR aif OR aiff OR ape OR cue OR dff OR dsf OR flac OR m3u OR m4a OR "
            "m4b OR m4p OR mp1 OR mp2 OR mp3 OR mpa OR ogg OR pcm OR pls OR ra OR ram OR "
            "wav OR wma OR wpl");
}

TEST(FileCategoryTest, FindsEveryVideoFile) {
  EXPECT_EQ(FileCategoryMap.at("video"),
            "3g2 OR 3gp OR asf OR avi OR dat OR divx OR dvr-ms OR f4v OR flv OR ifo OR "
            "iso OR m2t OR m2ts OR m4v OR mkv OR mov OR mp4 OR mpeg OR mpg OR mts OR qt OR "
            "rm OR rmvb OR swf OR tp OR trp OR ts OR vdr OR vob OR wmv OR xvid");
}

TEST(FileCategoryTest, FindsEveryImage) {
  EXPECT_EQ(FileCategoryMap.at("image"),
            "3fr OR arw OR bmp OR cr2 OR crw OR dcr OR dng OR erf OR gif OR ico OR jpe OR "
            "jpeg OR jpg OR k25 OR kdc OR mef OR mos OR mrw OR nef OR orf OR pef OR png OR "
            "psd OR ptx OR raf OR raw OR rw2 OR sr2 OR srf OR tif OR tiff OR ufo OR x3f");
}

}  // namespace
