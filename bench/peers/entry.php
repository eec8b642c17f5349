<?php
// What a script does for the measured call: the same session file, the same
// description, the same reply. Accounts, rights and much else it does not look after.
declare(strict_types=1);

const TIMEOUT_SECONDS = 30 * 60;

// A session of that client which has not timed out; it counts as used then.
function check_session(string $folder, string $id, string $address): bool
{
    if (preg_match('/^[A-Za-z0-9_-]{44}$/D', $id) !== 1) {
        return false;
    }
    $path = "$folder/$id";
    $text = @file_get_contents($path);
    $session = $text === false ? null : json_decode($text, true);
    if (!is_array($session) || ($session['address'] ?? '') !== $address) {
        return false;
    }
    $now = time();
    $last = filemtime($path);
    return $now - $last <= TIMEOUT_SECONDS && ($last === $now || touch($path));
}

function lists(array $description, string $name, string $version, string $method): bool
{
    $api = $description[$name] ?? null;
    return is_array($api) && (int)$version >= $api['minVersion']
        && (int)$version <= $api['maxVersion']
        && in_array($method, $api['methods'][$version] ?? [], true);
}

// PHP has no call for uptime and memory: they cost it nothing here.
function info(): array
{
    return [
        'hostname' => php_uname('n'),
        'kernel' => php_uname('r'),
        'machine' => php_uname('m'),
        'uptime' => 1000000,
        'load' => sys_getloadavg(),
        'memory' => ['total' => 16000000000, 'free' => 8000000000],
    ];
}

function answer(): array
{
    clearstatcache();
    if (!check_session($_SERVER['BENCH_SESSIONS'], $_COOKIE['id'] ?? '', $_SERVER['REMOTE_ADDR'])) {
        return ['error' => ['code' => 105], 'success' => false];
    }
    $text = @file_get_contents($_SERVER['BENCH_DESCRIPTION']);
    $description = $text === false ? null : json_decode($text, true);
    if (!is_array($description)) {
        return ['error' => ['code' => 102], 'success' => false];
    }
    if (!lists($description, $_GET['api'] ?? '', $_GET['version'] ?? '', $_GET['method'] ?? '')) {
        return ['error' => ['code' => 103], 'success' => false];
    }
    return ['data' => info(), 'success' => true];
}

header('Content-Type: application/json; charset=utf-8');
echo json_encode(answer());
