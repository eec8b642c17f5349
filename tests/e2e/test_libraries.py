"""API libraries that are good, bad, or not there."""

from case import Case


class Libraries(Case):
    def test_a_missing_one_is_111(self):
        self.fails(self.client.call("Test.Missing", "ok"), 111)

    def test_one_without_tables_is_111(self):
        self.fails(self.client.call("Test.NoTable", "ok"), 111)

    def test_one_whose_table_is_null_is_111(self):
        self.fails(self.client.call("Test.NullTable", "ok"), 111)

    def test_one_whose_check_table_is_null_serves(self):
        self.succeeds(self.client.call("Test.NullCheck", "ok"), "served")

    def test_a_folder_is_111(self):
        self.fails(self.client.call("Test.Folder", "ok"), 111)

    def test_a_text_is_111(self):
        self.fails(self.client.call("Test.Text", "ok"), 111)


class Methods(Case):
    def call(self, method, **parameters):
        return self.client.call("Test.Basic", method, **parameters)

    def test_one_not_in_the_table_is_121(self):
        self.fails(self.call("notInTable"), 121)

    def test_one_that_sets_nothing_is_117(self):
        self.fails(self.call("nothing"), 117)

    def test_one_that_throws_is_117(self):
        for method in ("throwException", "throwNumber", "throwAfterSuccess"):
            with self.subTest(method):
                self.fails(self.call(method), 117)

    def test_one_that_writes_to_standard_output_does_not_reach_the_client(self):
        reply = self.call("print", text="Content-type: text/plain\r\n\r\nof its own")
        self.assertNotIn(b"of its own", reply.body)
        self.assertIs(reply.document()["success"], True)
        self.assertEqual(reply.header("Content-type"), 'text/html; charset="UTF-8"')

    def test_one_that_reads_standard_input_finds_nothing(self):
        self.assertEqual(self.call("readInput").document()["data"]["text"], "")

    def test_one_that_fails_gives_its_code_and_details(self):
        self.check_document(
            self.call("fail", code=400, details='["a"]'),
            {"success": False, "error": {"code": 400, "errors": ["a"]}})

    def test_one_that_may_download_writes_the_whole_reply(self):
        reply = self.call("download", text="of its own")
        self.assertEqual(reply.body, b"of its own")
        self.assertEqual(reply.header("Content-type"), "text/plain")

    def test_one_works_in_the_web_api_directory(self):
        self.assertEqual(self.call("process").document()["data"]["folder"],
                         str(self.server.webapi_dir))


class Checks(Case):
    def test_the_function_of_the_last_row_checks_unlisted_methods(self):
        self.succeeds(self.client.call("Test.Guard", "unlisted"), "by the last row")
        self.check_document(
            self.client.call("Test.Guard", "unlisted", refuse="yes"),
            {"success": False, "error": {"code": 402, "errors": "refused"}})

    def test_a_row_of_its_own_keeps_a_method_from_the_last_row(self):
        self.succeeds(self.client.call("Test.Guard", "listed", refuse="yes"), "by its row")

    def test_a_row_lets_through_or_stops(self):
        self.succeeds(self.client.call("Test.Check", "pass"), "by its row")
        self.check_document(
            self.client.call("Test.Check", "stop"),
            {"success": False, "error": {"code": 401, "errors": "stopped"}})

    def test_a_check_that_throws_stops_with_117(self):
        self.fails(self.client.call("Test.Check", "throwException"), 117)
