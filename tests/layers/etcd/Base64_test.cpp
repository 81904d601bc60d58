#include "layers/etcd/detail/Base64.hpp"

#include <gtest/gtest.h>

#include <string>
#include <utility>
#include <vector>

namespace velkor::layers::etcd {
namespace {

const std::vector<std::pair<std::string, std::string>> pairs{
    {"", ""},
    {"f", "Zg=="},
    {"fo", "Zm8="},
    {"foo", "Zm9v"},
    {"foob", "Zm9vYg=="},
    {std::string("\0\xFF", 2), "AP8="},
    {"\xFB\xFF", "+/8="},
};

TEST(EtcdBase64, IsWritten) {
    for (const auto& [bytes, text] : pairs) EXPECT_EQ(toBase64(bytes), text);
}

TEST(EtcdBase64, IsRead) {
    for (const auto& [bytes, text] : pairs) EXPECT_EQ(fromBase64(text), bytes);
}

TEST(EtcdBase64, IsRefusedWhenItIsNone) {
    for (const char* text : {"Z", "Zg", "Zg=", "Z===", "====", "Zg==Zg==", "Zm9-",
                             "Zh==", "Zm9=", "Zm 9", "\xFF\xFF\xFF\xFF"}) {
        EXPECT_EQ(fromBase64(text), std::nullopt) << text;
    }
}

}  // namespace
}  // namespace velkor::layers::etcd
