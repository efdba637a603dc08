#include "Qelvar/Import/QVFileKind.h"

#include <gtest/gtest.h>
#include <rapidcheck/gtest.h>

namespace {

using namespace std::string_view_literals;
using enum QVFileKind;

TEST(FileKind, IsToldByTheFirstBytes) {
    for (const auto& [bytes, kind] :
         {std::pair("%PDF-1.7\n"sv, PDF),
          {"\x89PNG\r\n"sv, Picture},
          {"\0\0\0\x18"
           "ftypheic"sv,
           Picture},
          {"#!/bin/sh\n"sv, Script},
          {"\x7F"
           "ELF\2\1"sv,
           Program},
          {"{\"a\": [1]}"sv, JSON},
          {"a;b;c\n1;2,5;3\n"sv, Table},
          {"\xEF\xBB\xBF"
           "a\tb\r\n1\t2\r\n"sv,
           Table},
          {"Dear diary, \nno\n"sv, Text},
          {" \n\t"sv, Empty},
          {"\x1F\x8B\x08"sv, OtherArchive},
          {"<!DOCTYPE html><p>"sv, WebPage},
          {"<?xml version='1.0'?><!-- x --><cda:ClinicalDocument>"sv, ClinicalDocument},
          {"<gpx a='b'>"sv, OtherXML},
          {"\xFF\xFE<\0g\0p\0x\0>\0"sv, OtherXML},
          {"\1\2\3"sv, Binary},
          {"BMI,date\n22,1\n"sv, Table}})
        EXPECT_EQ(QVRecogniseBytes(bytes).kind, kind) << bytes;
}

/// Nothing that a records document may begin with is turned away, wherever its beginning is cut.
RC_GTEST_PROP(FileKind, ARecordsDocumentIsNeverMistaken, ()) {
    const auto blanks = *rc::gen::container<std::string>(rc::gen::element(' ', '\n', '\t', '\r'));
    const auto text =
        *rc::gen::container<std::string>(rc::gen::suchThat<char>([](char c) { return c != '-'; }));
    std::string document = *rc::gen::element<std::string>("", "\xEF\xBB\xBF");
    document += *rc::gen::element<std::string>("", "<?xml version=\"1.0\" encoding=\"UTF-8\"?>") + blanks;
    if (*rc::gen::arbitrary<bool>()) document += "<!--" + text + "-->" + blanks;
    document +=
        *rc::gen::element<std::string>("", "<!DOCTYPE HealthData [\n<!ELEMENT HealthData (Record)>]>\n");
    document += "<HealthData locale=\"en\">";
    const auto first = document.find('<') + 1;
    const auto length = *rc::gen::inRange(first, document.size() + 1);
    RC_ASSERT(QVRecogniseBytes(document.substr(0, length)).mayHoldRecords());
}

}  // namespace
