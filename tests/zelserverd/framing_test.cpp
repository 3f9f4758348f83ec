#include <gtest/gtest.h>

#include <string>

#include "framing.h"

using namespace std::string_literals;
using zelserverd::FileHeader;
using zelserverd::Request;

TEST(Framing, EncodesBigEndianLengthThenPayloadInOneBuffer) {
  std::string frame = zelserverd::encodeFrame("ab\0c"s);
  EXPECT_EQ(frame, "\x00\x00\x00\x04"s "ab\0c"s);
  std::string big(0x010203, 'x');
  std::string prefix = zelserverd::encodeFrame(big).substr(0, 4);
  EXPECT_EQ(prefix, "\x00\x01\x02\x03"s);
  const unsigned char bytes[4] = {0xFF, 0x00, 0x00, 0x01};
  EXPECT_EQ(zelserverd::decodeLength(bytes), 0xFF000001u);
}

TEST(Framing, ParsesRequestWithRepeatedNamesAndEqualsInValues) {
  Request request;
  auto error = zelserverd::parseRequest(
      "APIVERSION=1\0JOB_REQUEST\0clientID=\0requesterResultPort=4100\0request=a=b\0"
      "requesterResultPort=9"s,
      request);
  ASSERT_FALSE(error) << *error;
  EXPECT_EQ(request.keyword, "JOB_REQUEST");
  ASSERT_EQ(request.values.size(), 4u);
  EXPECT_EQ(request.get("clientID", "unset"), "");
  EXPECT_EQ(request.get("request"), "a=b");
  EXPECT_EQ(request.get("requesterResultPort"), "4100");
  EXPECT_EQ(request.all("requesterResultPort"), (std::vector<std::string>{"4100", "9"}));
  EXPECT_EQ(request.find("missing"), nullptr);
}

TEST(Framing, RefusesMalformedRequests) {
  const std::string cases[] = {
      ""s,
      "SERVER_SESSION_INIT"s,
      "APIVERSION=2\0SERVER_SESSION_INIT"s,
      "APIVERSION=1"s,
      "APIVERSION=1\0\0clientID="s,
      "APIVERSION=1\0KEY\0novalue"s,
      "APIVERSION=1\0KEY\0=value"s,
      "apiversion=1\0KEY"s,
  };
  for (const std::string& payload : cases) {
    Request request;
    EXPECT_TRUE(zelserverd::parseRequest(payload, request)) << "accepted: " << payload;
  }
}

TEST(Framing, RepliesAndAcknowledgements) {
  EXPECT_EQ(zelserverd::replyPayload(true, "true"), "SUCCESS\0true"s);
  EXPECT_EQ(zelserverd::replyPayload(false, "no"), "ERROR\0no"s);
  EXPECT_EQ(zelserverd::ackPayload(), "SUCCESS\0ready_to_transfer"s);
  EXPECT_TRUE(zelserverd::isAck("SUCCESS\0ready_to_transfer"s));
  EXPECT_FALSE(zelserverd::isAck("SUCCESS\0ready_to_transfer\0"s));
  EXPECT_FALSE(zelserverd::isAck("ERROR\0ready_to_transfer"s));
}

TEST(Framing, FileHeaderRoundTripAndStrictParsing) {
  EXPECT_EQ(zelserverd::fileHeaderPayload(0, 0), "fileLength=0\0fileCRC=0"s);
  auto header = zelserverd::parseFileHeader("fileLength=4294967295\0fileCRC=3421780262"s);
  ASSERT_TRUE(header);
  EXPECT_EQ(header->length, 4294967295u);
  EXPECT_EQ(header->crc, 3421780262u);

  const std::string refused[] = {
      "fileLength=10"s,                      // no CRC part
      "fileLength=4294967296\0fileCRC=1"s,   // beyond 32 bits
      "fileLength=\0fileCRC=1"s,             // empty number
      "fileLength=-1\0fileCRC=1"s,           // sign
      "fileLength= 1\0fileCRC=1"s,           // blank
      "fileLength=0x10\0fileCRC=1"s,         // not decimal
      "fileSize=1\0fileCRC=1"s,              // wrong name
      "fileLength=1\0fileCRC=4294967296"s,   // CRC beyond 32 bits
      "SUCCESS\0ready_to_transfer"s,
  };
  for (const std::string& payload : refused)
    EXPECT_FALSE(zelserverd::parseFileHeader(payload)) << "accepted: " << payload;
}

TEST(Framing, Crc32MatchesTheStandardCheckValueInAnySplit) {
  zelserverd::Crc32 whole;
  whole.update("123456789", 9);
  EXPECT_EQ(whole.value(), 0xCBF43926u);
  zelserverd::Crc32 pieces;
  pieces.update("1234", 4);
  pieces.update("56789", 5);
  EXPECT_EQ(pieces.value(), 0xCBF43926u);
  EXPECT_EQ(zelserverd::Crc32().value(), 0u);
}
