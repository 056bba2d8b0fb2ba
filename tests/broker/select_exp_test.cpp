/** @file Filters as providers see them. */
#include "tests/support/BrokerFixture.h"

#include <cstring>

namespace marlo::test {
namespace {

class SelectExpressions : public BrokerFixture {
  protected:
    CMPISelectExp* make(const char* query, const char* language = "WQL", CMPIArray** projection = nullptr) {
        return CMNewSelectExp(mb, query, language, projection, &status);
    }

    CMPIInstance* thing(CMPIUint16 number) {
        CMPIInstance* made = instance("Thing");
        CMSetProperty(made, "Number", &number, CMPI_uint16);
        return made;
    }

    bool evaluate(const CMPISelectExp* expression, const CMPIInstance* on) {
        return expression->ft->evaluate(expression, on, &status) != 0;
    }
};

TEST_F(SelectExpressions, TellTheirText) {
    const CMPISelectExp* made = make("SELECT * FROM Thing");
    ASSERT_NE(made, nullptr);
    EXPECT_EQ(text(made->ft->getString(made, &status)), "SELECT * FROM Thing");
    EXPECT_EQ(text(mb->eft->toString(mb, made, nullptr)), "SELECT * FROM Thing");
    EXPECT_EQ(text(mb->eft->getType(mb, made, nullptr)), "CMPISelectExp");
}

TEST_F(SelectExpressions, TellWhatTheySelect) {
    CMPIArray* projection = nullptr;
    make("SELECT Id, Number FROM Thing", "DMTF:CQL", &projection);
    ASSERT_NE(projection, nullptr);
    EXPECT_EQ(CMGetArrayType(projection, nullptr), CMPI_string);
    ASSERT_EQ(CMGetArrayCount(projection, nullptr), 2U);
    EXPECT_EQ(text(CMGetArrayElementAt(projection, 0, nullptr).value.string), "Id");
    EXPECT_EQ(text(CMGetArrayElementAt(projection, 1, nullptr).value.string), "Number");
    make("SELECT * FROM Thing", "WQL", &projection);
    EXPECT_EQ(projection, nullptr);
}

TEST_F(SelectExpressions, AreRefusedWithTheReason) {
    EXPECT_EQ(make("SELECT * FROM"), nullptr);
    EXPECT_EQ(status.rc, CMPI_RC_ERR_INVALID_QUERY);
    EXPECT_EQ(text(status.msg), "line 1, column 14: expected a class, found the end of the filter");
    EXPECT_EQ(make("SELECT * FROM Thing", "SQL"), nullptr);
    EXPECT_EQ(status.rc, CMPI_RC_ERR_QUERY_LANGUAGE_NOT_SUPPORTED);
    EXPECT_EQ(make("SELECT * FROM Thing ORDER BY Id"), nullptr);
    EXPECT_EQ(status.rc, CMPI_RC_ERR_QUERY_FEATURE_NOT_SUPPORTED);
    EXPECT_EQ(make(nullptr), nullptr);
    EXPECT_EQ(status.rc, CMPI_RC_ERR_INVALID_PARAMETER);
    EXPECT_EQ(make("SELECT * FROM Thing", nullptr), nullptr);
    EXPECT_EQ(status.rc, CMPI_RC_ERR_INVALID_PARAMETER);
}

TEST_F(SelectExpressions, AreEvaluatedOnInstances) {
    const CMPISelectExp* made = make("SELECT * FROM Base WHERE Number > 2");
    EXPECT_TRUE(evaluate(made, thing(3)));
    EXPECT_FALSE(evaluate(made, thing(2)));
    EXPECT_FALSE(evaluate(made, instance("Thing"))); // NULL
    EXPECT_FALSE(evaluate(made, instance("Other"))); // another class
    EXPECT_EQ(status.rc, CMPI_RC_OK);
    EXPECT_TRUE(evaluate(make("SELECT * FROM THING"), thing(3)));
    EXPECT_FALSE(evaluate(made, nullptr));
    EXPECT_EQ(status.rc, CMPI_RC_ERR_INVALID_HANDLE);
}

/** Property values by name; the parameter is the text of Id. */
CMPIData access(const char* name, void* parameter) {
    CMPIData data{};
    if (std::strcmp(name, "Id") == 0) {
        data.type = CMPI_chars;
        data.value.chars = static_cast<char*>(parameter);
    } else if (std::strcmp(name, "Number") == 0) {
        data.type = CMPI_uint16;
        data.value.uint16 = 7;
    } else {
        data.state = CMPI_notFound;
    }
    return data;
}

TEST_F(SelectExpressions, AreEvaluatedByAnAccessor) {
    char id[] = "a";
    const auto holds = [&](const std::string& condition) {
        const CMPISelectExp* made = make(("SELECT * FROM Thing WHERE " + condition).c_str());
        return made->ft->evaluateUsingAccessor(made, access, id, &status) != 0;
    };
    EXPECT_TRUE(holds("Id = 'a' AND Number = 7"));
    EXPECT_TRUE(holds("Id < 'b' AND Number < 8"));
    EXPECT_FALSE(holds("Id = 'b'"));
    EXPECT_TRUE(holds("Elsewhere IS NULL"));
    EXPECT_EQ(status.rc, CMPI_RC_OK);
    const CMPISelectExp* made = make("SELECT * FROM Thing");
    EXPECT_FALSE(made->ft->evaluateUsingAccessor(made, nullptr, nullptr, &status));
    EXPECT_EQ(status.rc, CMPI_RC_ERR_INVALID_PARAMETER);
}

TEST_F(SelectExpressions, AreNotTakenApart) {
    const CMPISelectExp* made = make("SELECT * FROM Thing");
    EXPECT_EQ(made->ft->getDOC(made, &status), nullptr);
    EXPECT_EQ(status.rc, CMPI_RC_ERR_NOT_SUPPORTED);
    EXPECT_EQ(made->ft->getCOD(made, &status), nullptr);
    EXPECT_EQ(status.rc, CMPI_RC_ERR_NOT_SUPPORTED);
}

TEST_F(SelectExpressions, LiveOnAsClones) {
    CMPISelectExp* clone = nullptr;
    {
        const broker::CallScope inner;
        clone = CMClone(make("SELECT * FROM Thing WHERE Number > 2"), nullptr);
    }
    ASSERT_NE(clone, nullptr);
    EXPECT_TRUE(evaluate(clone, thing(3)));
    EXPECT_EQ(CMRelease(clone).rc, CMPI_RC_OK);
    mb->mft->freeSelectExp(mb, CMClone(make("SELECT * FROM Thing"), nullptr));
}

} // namespace
} // namespace marlo::test
