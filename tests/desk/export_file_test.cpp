// The files of exports, as users name them.
#include "desk/model/ExportFile.h"

#include <gtest/gtest.h>

using namespace desk;

namespace
{
struct NAME_FACT
{
    char const* name;
    char const* typed;
    FileForm chosen;
    char const* file;
    FileForm form;
};

class ExportFiles : public testing::TestWithParam<NAME_FACT>
{
};
}  // namespace

TEST_P(ExportFiles, AreOfTheChosenForm_AndSoAreTheirNames)
{
    ExportFile const file = ExportFileOf(GetParam().typed, GetParam().chosen);
    EXPECT_EQ(file.name, GetParam().file);
    EXPECT_EQ(file.form, GetParam().form);
}

INSTANTIATE_TEST_SUITE_P(
    Facts, ExportFiles,
    testing::Values(
        NAME_FACT{"Xml", "/a/3-1.xml", FileForm::Xml, "/a/3-1.xml", FileForm::Xml},
        NAME_FACT{"XmlCapital", "/a/J.XML", FileForm::Xml, "/a/J.XML", FileForm::Xml},
        NAME_FACT{"XmlWithoutEnding", "/a/job", FileForm::Xml, "/a/job.xml", FileForm::Xml},
        NAME_FACT{"XmlWithAnother", "/a/job.1", FileForm::Xml, "/a/job.1.xml", FileForm::Xml},
        NAME_FACT{"Stream", "/a/j.stream", FileForm::Stream, "/a/j.stream", FileForm::Stream},
        NAME_FACT{"StreamWithoutEnding", "/a/job", FileForm::Stream, "/a/job.stream", FileForm::Stream},
        NAME_FACT{"StreamCapital", "/a/J.STREAM", FileForm::Stream, "/a/J.STREAM", FileForm::Stream},
        NAME_FACT{"StreamByItsNameAlone", "/a/J.Stream", FileForm::Xml, "/a/J.Stream", FileForm::Stream},
        NAME_FACT{"StreamWithTheNameOfTheXml", "/a/3-1.xml", FileForm::Stream, "/a/3-1.stream",
                  FileForm::Stream},
        NAME_FACT{"ShortName", "xml", FileForm::Xml, "xml.xml", FileForm::Xml}),
    [](auto const& fact) { return std::string(fact.param.name); });
