"""Requests as a good client sends them."""

from concurrent.futures import ThreadPoolExecutor

from case import Case
from client import form

PING = dict(api="TALO.System", version=1, method="ping")


class Calls(Case):
    def test_get_answers(self):
        self.succeeds(self.client.get(form(**PING, text="hi", count=3)), {"text": "hi", "count": 3})

    def test_post_answers(self):
        self.succeeds(self.client.post(form(**PING, text="hi", count=3)), {"text": "hi", "count": 3})

    def test_a_posted_json_object_gives_the_parameters(self):
        self.succeeds(
            self.client.post('{"api":"TALO.System","version":1,"method":"ping","text":"hi"}'),
            {"text": "hi"})

    def test_parameters_of_the_query_and_of_the_body_come_together(self):
        self.succeeds(self.client.post("text=hi", query=form(**PING, count=3)),
                      {"text": "hi", "count": 3})

    def test_a_parameter_in_query_and_body_takes_the_value_of_the_body(self):
        self.succeeds(self.client.post("text=body", query=form(**PING, text="query")),
                      {"text": "body"})

    def test_an_identity_in_query_and_body_takes_the_one_of_the_body(self):
        self.succeeds(self.client.post("version=2", query=form(api="Test.Basic", version=1,
                                                               method="ok")), "version 2")

    def test_head_answers_the_header_alone(self):
        reply = self.client.request("HEAD", "/webapi/entry.cgi?" + form(**PING, text="hi"))
        self.assertEqual(reply.status, 200)
        self.assertEqual(reply.body, b"")
        self.assertEqual(reply.header("Content-type"), 'text/html; charset="UTF-8"')
        self.assertEqual(reply.header("Expires"), "0")

    def test_request_methods_reach_the_api(self):
        caller = form(api="Test.Basic", version=1, method="caller")
        self.assertEqual(self.client.get(caller).document()["data"]["requestMethod"], 1)
        self.assertEqual(self.client.post(caller).document()["data"]["requestMethod"], 2)

    def test_other_request_methods_are_answered_by_their_query(self):
        for method in ("PUT", "DELETE", "PATCH", "OPTIONS"):
            with self.subTest(method):
                reply = self.client.request(method, "/webapi/entry.cgi?" + form(**PING, text="hi"))
                self.succeeds(reply, {"text": "hi"})

    def test_query_headers_and_cookies_reach_the_api(self):
        query = form(api="Test.Basic", version=1, method="caller", odd="%+ a")
        headers = {"X-Of-Mine": "a; b", "Cookie": "lang=en; id=1", "Authorization": "Basic eDp5"}
        seen = self.client.get(query, headers).document()["data"]["environment"]
        self.assertEqual(seen["QUERY_STRING"], query)
        self.assertEqual(seen["HTTP_X_OF_MINE"], "a; b")
        self.assertEqual(seen["HTTP_COOKIE"], "lang=en; id=1")
        self.assertEqual(seen["HTTP_AUTHORIZATION"], "Basic eDp5")
        self.assertEqual(seen["REQUEST_METHOD"], "GET")
        self.assertEqual(seen["SERVER_PORT"], str(self.server.port))
        self.assertEqual(seen["REMOTE_ADDR"], "127.0.0.1")

    def test_no_client_chooses_a_proxy_for_the_process(self):
        reply = self.client.call("Test.Basic", "caller", headers={"Proxy": "http://example.org"})
        self.assertEqual(reply.document()["data"]["environment"].get("HTTP_PROXY", ""), "")

    def test_no_client_poses_as_a_background_task(self):
        reply = self.client.call("Test.Basic", "caller", headers={"task-id": "1"})
        self.assertNotIn("task_id", reply.document()["data"]["environment"])

    def test_fifty_requests_at_once_get_their_own_answers(self):
        def ping(number):
            return self.client.get(form(**PING, text=f"nonce {number}", count=number))
        with ThreadPoolExecutor(max_workers=50) as pool:
            replies = list(pool.map(ping, range(50)))
        for number, reply in enumerate(replies):
            self.succeeds(reply, {"text": f"nonce {number}", "count": number})


class SessionParameter(Case):
    """The parameter "_sid" becomes the cookie "id"."""

    def cookie_after(self, header):
        headers = {"Cookie": header} if header else {}
        reply = self.client.call("Test.Basic", "caller", headers=headers, _sid="XYZ")
        return reply.document()["data"]["environment"]["HTTP_COOKIE"]

    def test_joins_other_cookies(self):
        self.assertEqual(self.cookie_after("lang=en"), "lang=en; id=XYZ")

    def test_puts_an_older_id_aside(self):
        self.assertEqual(self.cookie_after("id=OLD"), "abandoned=OLD; id=XYZ")

    def test_renames_inside_a_longer_name_too(self):
        self.assertEqual(self.cookie_after("sid=S1"), "sabandoned=S1; id=XYZ")

    def test_stands_alone_without_cookies(self):
        self.assertEqual(self.cookie_after(None), "id=XYZ")


class Refusals(Case):
    def test_an_unknown_api_is_102(self):
        self.fails(self.client.call("Test.Unknown", "ok"), 102)

    def test_an_unlisted_method_is_103(self):
        self.fails(self.client.call("Test.Basic", "unlisted"), 103)

    def test_a_method_of_another_version_is_103(self):
        self.fails(self.client.call("TALO.System", "info", version=1), 103)

    def test_a_version_above_the_maximum_is_104(self):
        self.fails(self.client.call("TALO.System", "ping", version=3), 104)

    def test_an_upload_that_is_not_allowed_is_115(self):
        body = '--b\r\nContent-Disposition: form-data; name="a"\r\n\r\n1\r\n--b--\r\n'
        self.fails(self.client.post(body, query=form(**PING), headers={
            "Content-Type": "multipart/form-data; boundary=b"}), 115)

    def test_a_relay_takes_a_session(self):
        self.fails(self.client.call("TALO.System", "ping", relay_nd=2), 119)
